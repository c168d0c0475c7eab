#include "support/wordnet_queries.h"

#include <cctype>
#include <random>
#include <string_view>

#include "wordnet/wordnet_data.h"

namespace quorelastic::bench {
namespace {

// The first two neighbouring words of plain letters; empty where there are none.
std::vector<std::string> TwoWords(std::string_view text) {
  std::vector<std::string> words(1);
  for (const char c : text) {
    if (std::islower(static_cast<unsigned char>(c)) != 0) {
      words.back() += c;
    } else if (words.back().size() < 4) {
      words.back().clear();  // leaves the words out that no query should be, such as AND and NOT
    } else if (c == ' ' && words.size() < 2) {
      words.emplace_back();
    } else {
      break;
    }
  }
  if (words.size() < 2 || words.back().size() < 4) return {};
  return words;
}

std::string MakeQuery(size_t form, const std::vector<std::string>& words) {
  switch (form % 5) {
    case 0:
      return "gloss:" + words[0];
    case 1:
      return "gloss:" + words[0] + " gloss:" + words[1];
    case 2:
      return "+gloss:" + words[0] + " +gloss:" + words[1];
    case 3:
      return "gloss:\"" + words[0] + " " + words[1] + "\"";
    default:
      return "lemma:" + words[0] + " gloss:" + words[1];
  }
}

}  // namespace

std::vector<std::string> MakeWordnetQueries(size_t count) {
  const std::vector<wordnet::Synset> synsets = wordnet::ReadSynsets("/usr/share/wordnet");
  std::mt19937 random(7);
  std::vector<std::string> queries;
  while (queries.size() < count) {
    const std::vector<std::string> words = TwoWords(synsets[random() % synsets.size()].gloss);
    if (!words.empty()) queries.push_back(MakeQuery(queries.size(), words));
  }
  return queries;
}

}  // namespace quorelastic::bench
