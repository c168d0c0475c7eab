#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/field_infos.h"
#include "elastic/format/term_cursor.h"

namespace vantrel::elastic {

// The order of a segment's dictionary, as seen by who looks for the terms of one field that begin with a prefix: by
// the fields' names, then by text. UTF-8 sorts by its bytes as by its code points.
class TermOrder {
 public:
  enum class Side { kBefore, kHere, kBehind };

  TermOrder(const std::vector<format::FieldInfo>& fields, const std::string& field, std::string prefix);

  // Whether the segment has such a field at all.
  bool has_field() const { return wanted_rank_ != kNoRank; }

  // Where the term at a cursor stands: before those that are looked for, among them, or behind them.
  Side SideOf(const format::TermCursor& cursor) const;

  // Of two field numbers, whether the terms of the first come before those of the second. The number -1, of the
  // place before all terms, comes first.
  bool FieldComesBefore(int32_t first, int32_t second) const { return RankOf(first) < RankOf(second); }

 private:
  static constexpr int32_t kNoRank = -2;

  int32_t RankOf(int32_t field) const { return field < 0 ? -1 : ranks_[static_cast<size_t>(field)]; }

  std::string prefix_;
  std::vector<int32_t> ranks_;  // by field number: its place among the sorted names
  int32_t wanted_rank_ = kNoRank;
};

// Sees to it that the terms that a cursor comes by ascend. For one thread at a time.
class AscendingTerms {
 public:
  explicit AscendingTerms(const TermOrder& order) : order_(order) {}

  // What is checked next comes behind this place.
  void StartBehind(const format::TermPlace& place, std::string_view text);

  // Throws IndexDamagedError where the term at the cursor does not come after the one before it, or is no UTF-8.
  void Check(const format::TermCursor& cursor);

  // The one that was checked last.
  int32_t field() const { return field_; }
  std::string_view text() const { return text_; }
  const format::TermInfo& info() const { return info_; }

 private:
  bool Ascends(const format::TermCursor& cursor) const;

  const TermOrder& order_;
  bool has_one_ = false;
  int32_t field_ = -1;
  std::string text_;
  format::TermInfo info_;
};

}  // namespace vantrel::elastic
