// Makes an index of the WordNet database, as Debian's wordnet-base package brings it: one document a synset.

#include <chrono>
#include <exception>
#include <iomanip>
#include <iostream>
#include <string>

#include "vantrel/elastic/index.h"
#include "wordnet/wordnet_data.h"

namespace {

using vantrel::elastic::Document;
using vantrel::elastic::FieldType;
using vantrel::elastic::IndexSettings;
using vantrel::elastic::TermVector;

constexpr const char* kDefaultData = "/usr/share/wordnet";

IndexSettings Settings() {
  IndexSettings settings;
  settings.fields = {
      {.name = "id", .type = FieldType::kKeyword, .norms = false, .frequencies = false},
      {.name = "lemma", .term_vector = TermVector::kPositions},
      {.name = "lemma_exact",
       .type = FieldType::kKeyword,
       .stored = false,
       .norms = false,
       .frequencies = false},
      {.name = "pos", .type = FieldType::kKeyword, .norms = false, .frequencies = false},
      {.name = "gloss", .term_vector = TermVector::kPositionsAndOffsets},
  };
  return settings;
}

Document ToDocument(const wordnet::Synset& synset) {
  Document document;
  document.fields.push_back({"id", synset.id});
  document.fields.push_back({"pos", synset.part_of_speech});
  for (const std::string& lemma : synset.lemmas) {
    document.fields.push_back({"lemma", lemma});
    document.fields.push_back({"lemma_exact", lemma});
  }
  document.fields.push_back({"gloss", synset.gloss});
  return document;
}

void MakeIndex(const std::string& folder, const std::string& data) {
  const auto start = std::chrono::steady_clock::now();
  const std::vector<wordnet::Synset> synsets = wordnet::ReadSynsets(data);
  const auto index = vantrel::elastic::Index::Create(folder, Settings());
  for (const wordnet::Synset& synset : synsets) index->Add(ToDocument(synset));
  index->Optimize();
  index->Commit();
  const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - start;
  std::cout << folder << ": " << index->CountDocuments().live << " documents in " << std::fixed
            << std::setprecision(1) << taken.count() << " seconds" << std::endl;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2 || argc > 3) {
    std::cerr << "usage: wordnet_index FOLDER [WORDNET_FOLDER=" << kDefaultData << "]" << std::endl;
    return 1;
  }
  try {
    MakeIndex(argv[1], argc > 2 ? argv[2] : kDefaultData);
  } catch (const std::exception& error) {
    std::cerr << "wordnet_index: " << error.what() << std::endl;
    return 1;
  }
  return 0;
}
