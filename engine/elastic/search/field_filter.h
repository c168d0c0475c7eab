#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/Filter.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "elastic/search/time_check.h"

namespace vantrel::elastic {

// Keeps the documents that hold one of some terms of a field.
class TermsFilter : public Lucene::Filter {
 public:
  TermsFilter(std::wstring field, std::vector<std::wstring> terms);

  Lucene::DocIdSetPtr getDocIdSet(const Lucene::IndexReaderPtr& reader) override;

 private:
  std::wstring field_;
  std::vector<std::wstring> terms_;
};

// Keeps the documents that hold a term of a field that a judge takes. The terms are shown to the judge in the
// order of their code points, from `start` on.
class JudgedTermsFilter : public Lucene::Filter {
 public:
  enum class Verdict { kTake, kPassOver, kEnd };
  using Judge = std::function<Verdict(const std::wstring& term)>;

  JudgedTermsFilter(std::wstring field, std::wstring start, Judge judge);

  Lucene::DocIdSetPtr getDocIdSet(const Lucene::IndexReaderPtr& reader) override;

 private:
  std::wstring field_;
  std::wstring start_;
  Judge judge_;
};

// Keeps the documents that all of some filters keep; there is at least one. How long each of them takes is up to
// a plugin, so that the clock is looked at after each.
class AllFilter : public Lucene::Filter {
 public:
  AllFilter(std::vector<Lucene::FilterPtr> filters, std::shared_ptr<TimeCheck> time);

  Lucene::DocIdSetPtr getDocIdSet(const Lucene::IndexReaderPtr& reader) override;

 private:
  Lucene::DocIdSetPtr Kept(const Lucene::FilterPtr& filter, const Lucene::IndexReaderPtr& reader) const;

  std::vector<Lucene::FilterPtr> filters_;
  std::shared_ptr<TimeCheck> time_;
};

}  // namespace vantrel::elastic
