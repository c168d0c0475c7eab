#include "elastic/suggest/term_order.h"

#include <algorithm>
#include <numeric>
#include <utility>

#include "elastic/format/text.h"

namespace vantrel::elastic {
namespace {

// The place of a byte of UTF-8 in the order of UTF-16 units: what lies beyond 16 bits is written there with units
// from d800 to dfff, which come before e000 to ffff.
int Utf16Rank(char byte) {
  constexpr int kBeyond16Bits = 0xf0;
  const int value = static_cast<unsigned char>(byte);
  return value >= kBeyond16Bits ? 0xed * 8 + 1 + (value - kBeyond16Bits) : value * 8;
}

bool ComesBeforeInUtf16(std::string_view left, std::string_view right) {
  return std::lexicographical_compare(left.begin(), left.end(), right.begin(), right.end(),
                                      [](char a, char b) { return Utf16Rank(a) < Utf16Rank(b); });
}

}  // namespace

TermOrder::TermOrder(const std::vector<format::FieldInfo>& fields, const std::string& field,
                     std::string prefix)
    : prefix_(std::move(prefix)), ranks_(fields.size()) {
  std::vector<size_t> sorted(fields.size());
  std::iota(sorted.begin(), sorted.end(), size_t{0});
  std::sort(sorted.begin(), sorted.end(),
            [&](size_t left, size_t right) { return fields[left].name < fields[right].name; });
  for (size_t rank = 0; rank < sorted.size(); ++rank) {
    ranks_[sorted[rank]] = static_cast<int32_t>(rank);
    if (fields[sorted[rank]].name == field) wanted_rank_ = static_cast<int32_t>(rank);
  }
}

TermOrder::Side TermOrder::SideOf(const format::TermCursor& cursor) const {
  const int32_t rank = RankOf(cursor.field());
  if (rank != wanted_rank_) return rank < wanted_rank_ ? Side::kBefore : Side::kBehind;
  if (cursor.text().starts_with(prefix_)) return Side::kHere;
  return cursor.text() < prefix_ ? Side::kBefore : Side::kBehind;
}

void AscendingTerms::StartBehind(const format::TermPlace& place, std::string_view text) {
  has_one_ = true;
  field_ = place.field;
  text_ = text;
  info_ = place.info;
}

// Some of the older layouts are sorted by UTF-16 units, others by code points: what neither order allows is damage.
bool AscendingTerms::Ascends(const format::TermCursor& cursor) const {
  if (!has_one_) return true;
  if (cursor.field() != field_) return order_.FieldComesBefore(field_, cursor.field());
  return text_ < cursor.text() || (!cursor.is_utf8() && ComesBeforeInUtf16(text_, cursor.text()));
}

void AscendingTerms::Check(const format::TermCursor& cursor) {
  if (!Ascends(cursor)) cursor.Damaged("term does not come after the one before it");
  if (cursor.is_utf8() && !format::IsValidUtf8(cursor.text())) {
    cursor.Damaged("term is not valid UTF-8");
  }
  has_one_ = true;
  field_ = cursor.field();
  text_ = cursor.text();
  info_ = cursor.info();
}

}  // namespace vantrel::elastic
