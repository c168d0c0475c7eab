#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/FilterIndexReader.h>

#include <memory>

#include "elastic/search/time_check.h"

namespace vantrel::elastic {

// A reader through which a search can be given up while it walks, whether it finds anything or not: whatever goes
// through a dictionary, or through the documents of a term, takes part in the time check. The library is
// interrupted between two operations of its own only, so that nothing it shares between searches is left halfway.
// For one thread at a time; what it reads stands in another reader, which may serve many.
class TimedReader : public Lucene::FilterIndexReader {
 public:
  TimedReader(const Lucene::IndexReaderPtr& reader, std::shared_ptr<TimeCheck> time);

  Lucene::Collection<Lucene::IndexReaderPtr> getSequentialSubReaders() override;

  int32_t docFreq(const Lucene::TermPtr& term) override;
  Lucene::TermEnumPtr terms() override;
  Lucene::TermEnumPtr terms(const Lucene::TermPtr& term) override;
  Lucene::TermDocsPtr termDocs() override;
  Lucene::TermDocsPtr termDocs(const Lucene::TermPtr& term) override;
  Lucene::TermPositionsPtr termPositions() override;
  Lucene::TermPositionsPtr termPositions(const Lucene::TermPtr& term) override;

 private:
  std::shared_ptr<TimeCheck> time_;
};

}  // namespace vantrel::elastic
