// Writes an index of documents as they come in practice, until its files take a given number of MiB: texts of words
// that are frequent or rare as in a language, with positions, stored values, and term vectors for one field. By the
// index library alone, merged as its defaults have it.

#include <lucene++/LuceneHeaders.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <random>
#include <string>

#include "support/sized_index.h"

namespace {

using Lucene::AbstractField;
using Lucene::newLucene;
using Lucene::String;
using Lucene::StringUtils;

constexpr int kVocabulary = 400000;
constexpr uint64_t kMebibyte = uint64_t{1} << 20;

class Words {
 public:
  // The n-th word is about n times as rare as the first.
  String Next() {
    const double place = static_cast<double>(random_()) / static_cast<double>(std::mt19937::max());
    const auto rank = static_cast<int64_t>(std::exp(place * std::log(static_cast<double>(kVocabulary))));
    return StringUtils::toString(rank * 7919 % 10000019, 36);
  }

  String Text(int words) {
    String text;
    for (; words > 0; --words) text += Next() + L" ";
    return text;
  }

 private:
  std::mt19937 random_{1};
};

Lucene::DocumentPtr MakeDocument(Words& words, int number) {
  const auto document = newLucene<Lucene::Document>();
  const auto add = [&](const String& name, const String& value, AbstractField::Store store,
                       AbstractField::Index index, AbstractField::TermVector vector) {
    document->add(newLucene<Lucene::Field>(name, value, store, index, vector));
  };
  add(L"id", StringUtils::toString(number), AbstractField::STORE_YES,
      AbstractField::INDEX_NOT_ANALYZED_NO_NORMS, AbstractField::TERM_VECTOR_NO);
  add(L"title", words.Text(8), AbstractField::STORE_YES, AbstractField::INDEX_ANALYZED,
      AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS);
  add(L"body", words.Text(200), AbstractField::STORE_YES, AbstractField::INDEX_ANALYZED,
      AbstractField::TERM_VECTOR_NO);
  return document;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: make_documents FOLDER MEBIBYTES\n";
    return 2;
  }
  Words words;
  quorelastic::bench::WriteSizedIndex(argv[1], std::strtoull(argv[2], nullptr, 10) * kMebibyte,
                                      [&](int number) { return MakeDocument(words, number); });
  return 0;
}
