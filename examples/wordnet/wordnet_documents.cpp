// Prints the WordNet database, as Debian's wordnet-base package brings it, as documents for the daemon's import
// folder: one JSON object a line, one for each synset.

#include <exception>
#include <iostream>
#include <string>

#include "vantrel/elastic/json_value.h"
#include "wordnet/wordnet_data.h"

namespace {

constexpr const char* kDefaultData = "/usr/share/wordnet";

std::string ToLine(const wordnet::Synset& synset) {
  vantrel::elastic::JsonValue document;
  document["id"] = synset.id;
  document["pos"] = synset.part_of_speech;
  document["gloss"] = synset.gloss;
  for (const std::string& lemma : synset.lemmas) document["lemma"].append(lemma);
  return document.toString();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc > 2) {
    std::cerr << "usage: wordnet_documents [WORDNET_FOLDER=" << kDefaultData << "]" << std::endl;
    return 1;
  }
  try {
    for (const wordnet::Synset& synset : wordnet::ReadSynsets(argc > 1 ? argv[1] : kDefaultData)) {
      std::cout << ToLine(synset) << '\n';
    }
  } catch (const std::exception& error) {
    std::cerr << "wordnet_documents: " << error.what() << std::endl;
    return 1;
  }
  std::cout.flush();
  return std::cout.good() ? 0 : 1;
}
