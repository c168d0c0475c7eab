#include "wordnet/wordnet_data.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <fstream>
#include <stdexcept>
#include <system_error>

namespace wordnet {
namespace {

struct PartOfSpeech {
  char letter;
  const char* file;
  const char* name;
};

constexpr std::array kPartsOfSpeech = {
    PartOfSpeech{'n', "data.noun", "noun"}, PartOfSpeech{'v', "data.verb", "verb"},
    PartOfSpeech{'a', "data.adj", "adjective"}, PartOfSpeech{'r', "data.adv", "adverb"}};

// Hands out the words of a line that a single blank separates.
class Words {
 public:
  explicit Words(std::string_view text) : rest_(text) {}

  std::string_view Next(const char* what) {
    const size_t end = std::min(rest_.find(' '), rest_.size());
    const std::string_view word = rest_.substr(0, end);
    if (word.empty()) throw std::runtime_error(std::string("no ") + what);
    rest_.remove_prefix(std::min(end + 1, rest_.size()));
    return word;
  }

 private:
  std::string_view rest_;
};

bool IsOffset(std::string_view text) {
  return text.size() == 8 &&
         std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
}

// "round(a)" is the adjective "round" with a note on where it may stand.
std::string ToLemma(std::string_view word) {
  if (word.ends_with(')')) word = word.substr(0, word.find('('));
  std::string lemma(word);
  std::replace(lemma.begin(), lemma.end(), '_', ' ');
  return lemma;
}

std::string_view Trim(std::string_view text) {
  const size_t first = text.find_first_not_of(' ');
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(' ') - first + 1);
}

const char* PartOfSpeechName(char letter) {
  for (const PartOfSpeech& part : kPartsOfSpeech) {
    if (part.letter == letter) return part.name;
  }
  throw std::runtime_error(std::string("unknown part of speech ") + letter);
}

void AppendFile(const std::string& path, char letter, std::vector<Synset>& synsets) {
  std::ifstream file(path, std::ios::binary);
  if (!file) throw std::runtime_error(path + ": cannot open: " + std::generic_category().message(errno));
  std::string line;
  for (size_t number = 1; std::getline(file, line); ++number) {
    if (line.starts_with("  ")) continue;  // the licence, at the top
    try {
      synsets.push_back(ParseSynset(line, letter));
    } catch (const std::runtime_error& error) {
      throw std::runtime_error(path + ", line " + std::to_string(number) + ": " + error.what());
    }
  }
  if (file.bad() || !file.eof()) throw std::runtime_error(path + ": cannot read");
}

}  // namespace

Synset ParseSynset(std::string_view line, char letter) {
  const size_t bar = line.find(" | ");
  if (bar == std::string_view::npos) throw std::runtime_error("no gloss");
  Words words(line.substr(0, bar));
  const std::string_view offset = words.Next("offset");
  if (!IsOffset(offset)) throw std::runtime_error("the offset is not of eight digits");
  words.Next("file number");
  words.Next("type");
  const std::string_view count_text = words.Next("word count");
  int count = 0;
  const auto [end, error] =
      std::from_chars(count_text.data(), count_text.data() + count_text.size(), count, 16);
  if (error != std::errc() || end != count_text.data() + count_text.size() || count < 1) {
    throw std::runtime_error("the word count is no number above 0");
  }
  Synset synset{
      letter + std::string(offset), PartOfSpeechName(letter), {}, std::string(Trim(line.substr(bar + 3)))};
  for (int i = 0; i < count; ++i) {
    synset.lemmas.push_back(ToLemma(words.Next("word")));
    words.Next("word id");
  }
  return synset;
}

std::vector<Synset> ReadSynsets(const std::string& folder) {
  std::vector<Synset> synsets;
  for (const PartOfSpeech& part : kPartsOfSpeech) AppendFile(folder + "/" + part.file, part.letter, synsets);
  return synsets;
}

}  // namespace wordnet
