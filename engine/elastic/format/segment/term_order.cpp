#include "elastic/format/segment/term_order.h"

#include <algorithm>
#include <cstring>
#include <numeric>

namespace vantrel::elastic::format {
namespace {

// The place of a byte of UTF-8 in the order of UTF-16 units: what lies beyond 16 bits is written there with units from
// d800 to dfff, which come before e000 to ffff. Bytes that continue a character keep their order.
int Utf16Rank(char byte) {
  constexpr int kBeyond16Bits = 0xf0;
  const int value = static_cast<unsigned char>(byte);
  return value >= kBeyond16Bits ? 0xed * 16 + 1 + (value - kBeyond16Bits) : value * 16;
}

}  // namespace

size_t SameLength(std::string_view left, std::string_view right, size_t same) {
  const size_t most = std::min(left.size(), right.size());
  for (; same + 8 <= most; same += 8) {
    if (std::memcmp(left.data() + same, right.data() + same, 8) != 0) break;
  }
  while (same < most && left[same] == right[same]) ++same;
  return same;
}

TermOrders OrdersBefore(std::string_view left, std::string_view right, size_t same) {
  same = SameLength(left, right, same);
  if (same == right.size()) return 0;
  if (same == left.size()) return kByBoth;
  const bool by_bytes = static_cast<unsigned char>(left[same]) < static_cast<unsigned char>(right[same]);
  const bool by_utf16 = Utf16Rank(left[same]) < Utf16Rank(right[same]);
  return static_cast<TermOrders>((by_bytes ? kByCodePoints : 0) | (by_utf16 ? kByUtf16 : 0));
}

FieldOrder::FieldOrder(const std::vector<FieldInfo>& fields) : ranks_(fields.size()) {
  std::vector<uint32_t> sorted(fields.size());
  std::iota(sorted.begin(), sorted.end(), 0U);
  const auto rank = [&](TermOrders order, uint32_t Ranks::*member) {
    const auto is_before = [&](uint32_t left, uint32_t right) {
      return (format::OrdersBefore(fields[left].name, fields[right].name) & order) != 0;
    };
    std::sort(sorted.begin(), sorted.end(), is_before);
    uint32_t place = 0;
    for (size_t i = 0; i < sorted.size(); ++i) {
      if (i > 0 && is_before(sorted[i - 1], sorted[i])) ++place;
      ranks_[sorted[i]].*member = place;
    }
  };
  rank(kByCodePoints, &Ranks::by_code_points);
  rank(kByUtf16, &Ranks::by_utf16);
}

TermOrders FieldOrder::OrdersBefore(int32_t left, int32_t right) const {
  if (left < 0 || right < 0) return left < right ? kByBoth : 0;
  const Ranks& a = ranks_[static_cast<size_t>(left)];
  const Ranks& b = ranks_[static_cast<size_t>(right)];
  return static_cast<TermOrders>((a.by_code_points < b.by_code_points ? kByCodePoints : 0) |
                                 (a.by_utf16 < b.by_utf16 ? kByUtf16 : 0));
}

}  // namespace vantrel::elastic::format
