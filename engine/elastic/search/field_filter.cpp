#include "elastic/search/field_filter.h"

// Not without the index library's main header.
#include <lucene++/OpenBitSetDISI.h>

#include <algorithm>
#include <utility>

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;

void SetAll(Lucene::OpenBitSet& bits, const Lucene::TermDocsPtr& documents) {
  while (documents->next()) bits.set(static_cast<int64_t>(documents->doc()));
}

}  // namespace

TermsFilter::TermsFilter(std::wstring field, std::vector<std::wstring> terms)
    : field_(std::move(field)), terms_(std::move(terms)) {
  // In the dictionary's order, it is walked but once.
  std::sort(terms_.begin(), terms_.end());
}

Lucene::DocIdSetPtr TermsFilter::getDocIdSet(const Lucene::IndexReaderPtr& reader) {
  const auto bits = newLucene<Lucene::OpenBitSet>(reader->maxDoc());
  const Lucene::TermDocsPtr documents = reader->termDocs();
  for (const std::wstring& term : terms_) {
    documents->seek(newLucene<Lucene::Term>(field_, term));
    SetAll(*bits, documents);
  }
  documents->close();
  return bits;
}

JudgedTermsFilter::JudgedTermsFilter(std::wstring field, std::wstring start, Judge judge)
    : field_(std::move(field)), start_(std::move(start)), judge_(std::move(judge)) {}

Lucene::DocIdSetPtr JudgedTermsFilter::getDocIdSet(const Lucene::IndexReaderPtr& reader) {
  const auto bits = newLucene<Lucene::OpenBitSet>(reader->maxDoc());
  const Lucene::TermDocsPtr documents = reader->termDocs();
  const Lucene::TermEnumPtr walk = reader->terms(newLucene<Lucene::Term>(field_, start_));
  do {
    const Lucene::TermPtr term = walk->term();
    if (!term || term->field() != field_) break;
    const Verdict verdict = judge_(term->text());
    if (verdict == Verdict::kEnd) break;
    if (verdict == Verdict::kPassOver) continue;
    documents->seek(walk);
    SetAll(*bits, documents);
  } while (walk->next());
  walk->close();
  documents->close();
  return bits;
}

AllFilter::AllFilter(std::vector<Lucene::FilterPtr> filters, std::shared_ptr<TimeCheck> time)
    : filters_(std::move(filters)), time_(std::move(time)) {}

Lucene::DocIdSetPtr AllFilter::Kept(const Lucene::FilterPtr& filter,
                                    const Lucene::IndexReaderPtr& reader) const {
  Lucene::DocIdSetPtr kept = filter->getDocIdSet(reader);
  time_->LookAtClock();
  return kept;
}

Lucene::DocIdSetPtr AllFilter::getDocIdSet(const Lucene::IndexReaderPtr& reader) {
  if (filters_.size() == 1) return Kept(filters_.front(), reader);
  const auto bits = newLucene<Lucene::OpenBitSetDISI>(reader->maxDoc());
  bool is_first = true;
  for (const Lucene::FilterPtr& filter : filters_) {
    // That there is no document the library may say in two ways.
    const Lucene::DocIdSetPtr kept = Kept(filter, reader);
    const Lucene::DocIdSetIteratorPtr documents = kept ? kept->iterator() : Lucene::DocIdSetIteratorPtr();
    if (!documents) return Lucene::DocIdSetPtr();
    if (is_first) {
      bits->inPlaceOr(documents);
    } else {
      bits->inPlaceAnd(documents);
    }
    is_first = false;
  }
  return bits;
}

}  // namespace vantrel::elastic
