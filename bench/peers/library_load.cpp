// Makes an index of the WordNet database through the index library's own writer alone.

#include <lucene++/LuceneHeaders.h>

#include <exception>
#include <iostream>
#include <string>

#include "wordnet/wordnet_data.h"

namespace {

using Lucene::AbstractField;
using Lucene::newLucene;
using Lucene::StringUtils;

void AddKeyword(const Lucene::DocumentPtr& document, const Lucene::String& name, const std::string& value) {
  const auto field = newLucene<Lucene::Field>(name, StringUtils::toUnicode(value), AbstractField::STORE_YES,
                                              AbstractField::INDEX_NOT_ANALYZED_NO_NORMS);
  field->setOmitTermFreqAndPositions(true);
  document->add(field);
}

void AddText(const Lucene::DocumentPtr& document, const Lucene::String& name, const std::string& value,
             AbstractField::TermVector vector) {
  document->add(newLucene<Lucene::Field>(name, StringUtils::toUnicode(value), AbstractField::STORE_YES,
                                         AbstractField::INDEX_ANALYZED, vector));
}

Lucene::DocumentPtr ToDocument(const wordnet::Synset& synset) {
  const auto document = newLucene<Lucene::Document>();
  AddKeyword(document, L"id", synset.id);
  AddKeyword(document, L"pos", synset.part_of_speech);
  for (const std::string& lemma : synset.lemmas) {
    AddText(document, L"lemma", lemma, AbstractField::TERM_VECTOR_WITH_POSITIONS);
  }
  AddText(document, L"gloss", synset.gloss, AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS);
  return document;
}

void Load(const std::string& folder) {
  const auto analyzer = newLucene<Lucene::StandardAnalyzer>(Lucene::LuceneVersion::LUCENE_30,
                                                            Lucene::HashSet<Lucene::String>::newInstance());
  const auto writer =
      newLucene<Lucene::IndexWriter>(Lucene::FSDirectory::open(StringUtils::toUnicode(folder)), analyzer,
                                     true, Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  for (const wordnet::Synset& synset : wordnet::ReadSynsets("/usr/share/wordnet")) {
    writer->addDocument(ToDocument(synset));
  }
  writer->commit();
  std::cout << writer->numDocs() << " documents" << std::endl;
  writer->close();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_library_load FOLDER\n";
    return 2;
  }
  try {
    Load(argv[1]);
  } catch (const std::exception& error) {
    std::cerr << error.what() << std::endl;
    return 1;
  }
  return 0;
}
