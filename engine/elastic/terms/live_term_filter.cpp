#include "elastic/terms/live_term_filter.h"

namespace vantrel::elastic {

LiveTermFilter::LiveTermFilter(const format::SegmentFiles& files)
    : deletions_(files.deletions, files.info.document_count),
      postings_(files.postings, files.info.document_count) {}

bool LiveTermFilter::IsLive(const format::TermInfo& term, bool omits_frequencies) {
  if (IsLiveAtFirstSight(term)) return true;
  postings_.Seek(term, omits_frequencies);
  while (postings_.Next()) {
    if (!deletions_.Contains(postings_.document())) return true;
  }
  return false;
}

}  // namespace vantrel::elastic
