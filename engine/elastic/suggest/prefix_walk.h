#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/field_infos.h"
#include "elastic/format/segment_files.h"
#include "elastic/format/term_cursor.h"
#include "elastic/suggest/dictionary_part.h"
#include "elastic/suggest/term_order.h"
#include "elastic/terms/live_term_filter.h"

namespace vantrel::elastic {

// The terms of one field of a segment that begin with certain bytes, in the dictionary's order. It begins near the
// first of them, by the index over the dictionary, and ends near the last: what it takes does not hang on the other
// terms. For one thread at a time. Everything may throw IndexError, and what reading the files throws.
//
// It reads whole blocks of the dictionary, a block being what lies between two entries of the index, to the end of the
// one that holds the last term. Every term and every entry that it passes must come after the one before it, and the
// entries must be found again in the dictionary: those between the blocks, and those further ahead that the first
// one's text is put together from. So a wrong bit shows, unless
// - what it leaves of the dictionary could have been written so: other texts in order, fewer documents, or
// - it makes an entry of the index, further ahead, share more of its text with the one before it, and that leaves
//   all entries in order, or
// - it moves the postings of all entries behind it alike; they are only read where documents are deleted.
// Of the segment's files it holds the dictionary open and, where documents are deleted, what tells of them.
class PrefixWalk {
 public:
  PrefixWalk(format::SegmentFiles files, const std::string& field, std::string prefix);
  PrefixWalk(const PrefixWalk&) = delete;
  PrefixWalk& operator=(const PrefixWalk&) = delete;

  // Moves to the next term, at first to the first one; false when there is none, and then all checks are done.
  bool Next();

  // The term, while Next() has returned true last; valid until the next call.
  std::string_view text() const { return cursor_.text(); }
  int32_t document_frequency() const { return cursor_.info().document_frequency; }

  // Whether a document holds the term that is not deleted. False from the first of them leaves it open; the second
  // knows, but may have to read postings.
  bool IsLiveAtFirstSight();
  bool IsLive();

  // Throws IndexDamagedError about the term.
  [[noreturn]] void Damaged(const std::string& problem) const { cursor_.Damaged(problem); }

 private:
  format::TermCursor OpenCursor(const std::shared_ptr<const format::ByteSource>& source,
                                format::TermCursor::File file) const;
  void SeekByIndex();
  void Begin(DictionaryPart part);
  bool Advance();
  void CheckEntry();
  void CheckEntries() const;
  LiveTermFilter& live_filter();

  format::SegmentFiles files_;
  std::vector<format::FieldInfo> fields_;
  TermOrder order_;
  AscendingTerms passed_;
  format::TermCursor cursor_;
  DictionaryPart part_;  // that is read now
  bool at_end_ = true;   // of it
  uint64_t number_ = 0;  // of the term that comes next
  Fingerprint entries_;  // that were found again
  // Made when it is first asked: it reads the whole deletions file.
  std::optional<LiveTermFilter> live_filter_;
};

}  // namespace vantrel::elastic
