#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/field_infos.h"
#include "elastic/format/segment_files.h"
#include "elastic/format/term_cursor.h"
#include "elastic/terms/term_walk.h"

namespace vantrel::elastic {

// The terms of one field of a segment that begin with certain bytes, in the dictionary's order. It begins near the
// first of them, by the index over the dictionary, and ends behind the last: what it takes does not hang on the
// other terms. For one thread at a time. Everything may throw IndexError.
class PrefixWalk {
 public:
  PrefixWalk(format::SegmentFiles files, const std::string& field, std::string prefix);
  PrefixWalk(const PrefixWalk&) = delete;
  PrefixWalk& operator=(const PrefixWalk&) = delete;

  // Moves to the next term, at first to the first one; false when there is none.
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
  // Where a field stands, seen from the one that is looked at.
  enum class Side : int8_t { kBefore, kHere, kBehind };

  std::vector<Side> SidesOf(const std::string& field) const;
  format::TermCursor OpenCursor() const;
  void SeekByIndex();
  bool IsBefore(const format::TermCursor& cursor) const;
  void CheckOrder();
  LiveTermFilter& live_filter();

  format::SegmentFiles files_;
  std::string prefix_;
  std::vector<format::FieldInfo> fields_;
  std::vector<Side> sides_;  // by field number
  format::TermCursor cursor_;
  bool at_end_ = false;
  bool has_previous_ = false;
  std::string previous_;
  std::optional<LiveTermFilter>
      live_filter_;  // made when it is first asked: it reads the whole deletions file
};

}  // namespace vantrel::elastic
