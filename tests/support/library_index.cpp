#include "support/library_index.h"

#include <lucene++/SerialMergeScheduler.h>

namespace quorelastic::testing {
namespace {

using Lucene::newLucene;
using Lucene::StringUtils;

Lucene::AbstractField::TermVector ToLibrary(LibraryField::Vector vector) {
  switch (vector) {
    case LibraryField::Vector::kNone:
      return Lucene::AbstractField::TERM_VECTOR_NO;
    case LibraryField::Vector::kTerms:
      return Lucene::AbstractField::TERM_VECTOR_YES;
    case LibraryField::Vector::kPositions:
      return Lucene::AbstractField::TERM_VECTOR_WITH_POSITIONS;
    case LibraryField::Vector::kOffsets:
      return Lucene::AbstractField::TERM_VECTOR_WITH_OFFSETS;
    case LibraryField::Vector::kPositionsAndOffsets:
      return Lucene::AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS;
  }
  return Lucene::AbstractField::TERM_VECTOR_NO;
}

Lucene::FieldPtr ToLibrary(const LibraryField& field) {
  const auto made = newLucene<Lucene::Field>(
      StringUtils::toUnicode(field.name), StringUtils::toUnicode(field.value),
      field.stored ? Lucene::AbstractField::STORE_YES : Lucene::AbstractField::STORE_NO,
      field.keyword ? Lucene::AbstractField::INDEX_NOT_ANALYZED : Lucene::AbstractField::INDEX_ANALYZED,
      ToLibrary(field.vector));
  made->setOmitNorms(!field.norms);
  made->setOmitTermFreqAndPositions(!field.frequencies);
  return made;
}

}  // namespace

LibraryIndex::LibraryIndex(const std::string& path, const Options& options) {
  writer_ = newLucene<Lucene::IndexWriter>(Lucene::FSDirectory::open(StringUtils::toUnicode(path)),
                                           newLucene<Lucene::WhitespaceAnalyzer>(), true,
                                           Lucene::IndexWriter::MaxFieldLengthUNLIMITED);
  const auto policy = newLucene<Lucene::LogDocMergePolicy>(writer_);
  policy->setMergeFactor(1000);
  policy->setUseCompoundFile(options.compound);
  policy->setUseCompoundDocStore(options.compound);
  writer_->setMergePolicy(policy);
  writer_->setMergeScheduler(newLucene<Lucene::SerialMergeScheduler>());
  writer_->setMaxBufferedDocs(options.documents_per_segment < 2 ? 2 : options.documents_per_segment);
  writer_->setTermIndexInterval(options.term_index_interval);
}

LibraryIndex::~LibraryIndex() { Close(); }

void LibraryIndex::Add(const std::vector<LibraryField>& document) {
  const auto made = newLucene<Lucene::Document>();
  for (const LibraryField& field : document) made->add(ToLibrary(field));
  writer_->addDocument(made);
}

void LibraryIndex::Delete(const std::string& field, const std::string& term) {
  writer_->deleteDocuments(
      newLucene<Lucene::Term>(StringUtils::toUnicode(field), StringUtils::toUnicode(term)));
}

void LibraryIndex::Commit() { writer_->commit(); }

void LibraryIndex::Optimize() { writer_->optimize(); }

void LibraryIndex::Close() {
  if (writer_) writer_->close();
  writer_.reset();
}

}  // namespace quorelastic::testing
