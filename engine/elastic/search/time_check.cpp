#include "elastic/search/time_check.h"

#include <lucene++/LuceneHeaders.h>

namespace vantrel::elastic {

void TimeCheck::LookAtClock() {
  steps_ = 0;
  if (!deadline_.has_value() || std::chrono::steady_clock::now() < *deadline_) return;
  boost::throw_exception(Lucene::TimeExceededException(L"the search took too long"));
}

}  // namespace vantrel::elastic
