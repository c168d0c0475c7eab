#pragma once

#include "elastic/format/segment/deletions.h"
#include "elastic/format/segment/postings.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/segment/segment_files.h"

namespace vantrel::elastic {

// Tells whether a term still has a document that is not deleted.
class LiveTermFilter {
 public:
  explicit LiveTermFilter(const format::SegmentFiles& files);

  // Not all of its documents can be deleted: most terms are settled so, without a look at their postings.
  bool IsLiveAtFirstSight(const format::TermInfo& term) const {
    return term.document_frequency > deletions_.count();
  }

  // May have to read the term's postings.
  bool IsLive(const format::TermInfo& term, bool omits_frequencies);

  void ReleasePages() { deletions_.ReleasePages(); }

 private:
  format::Deletions deletions_;
  format::PostingsReader postings_;
};

}  // namespace vantrel::elastic
