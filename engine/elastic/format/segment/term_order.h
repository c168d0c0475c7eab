#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include "elastic/format/segment/field_infos.h"

namespace vantrel::elastic::format {

// The order of terms: by the name of the field, then by text. Two orders of text are in use. They differ only where a
// character beyond 16 bits is compared with one of U+E000 to U+FFFF.
//
//   code points  written in UTF-8 (dictionaries of format -4, term vectors of format 4) by the index library, Lucene++
//                3.0.8, and by our writer; the library looks terms up by this order in every format. UTF-8 sorts by
//                its bytes as by its code points.
//   UTF-16       written in the older layouts, which hold texts as UTF-16 code units, by Java programs.
//
// Accepted are code points in UTF-8, and either order in the older layouts, but one order only within a dictionary: the
// first pair of terms on which the two orders differ decides which. A dictionary of format -4 in UTF-16 order, as Java
// writes it, is accepted where the orders agree on its terms; otherwise lookups would not find all of them.
using TermOrders = uint8_t;  // a set of orders
inline constexpr TermOrders kByCodePoints = 1;
inline constexpr TermOrders kByUtf16 = 2;
inline constexpr TermOrders kByBoth = kByCodePoints | kByUtf16;

// By which orders `left` comes before `right`, which have the first `same` bytes in common. Well-formed UTF-8; of
// other bytes, some order.
TermOrders OrdersBefore(std::string_view left, std::string_view right, size_t same = 0);

// How many leading bytes two texts have in common, at least `same` of which the caller knows.
size_t SameLength(std::string_view left, std::string_view right, size_t same = 0);

// The order that the terms of one dictionary have, found out while they are read.
class OrderOfTerms {
 public:
  explicit OrderOfTerms(bool is_utf8) : accepted_(is_utf8 ? kByCodePoints : kByBoth) {}

  // Whether there is an accepted order by which all pairs so far ascend. `ascends_by` is about the next pair.
  bool Take(TermOrders ascends_by) {
    consistent_ = static_cast<TermOrders>(consistent_ & ascends_by);
    return (consistent_ & accepted_) != 0;
  }

  // The orders by which all pairs so far ascend.
  TermOrders consistent() const { return consistent_; }

 private:
  TermOrders accepted_;
  TermOrders consistent_ = kByBoth;
};

// The fields of a segment in the order of their names. Fields are compared by number, in constant time.
class FieldOrder {
 public:
  explicit FieldOrder(const std::vector<FieldInfo>& fields);

  // By which orders the terms of field number `left` come before those of `right`. The number -1, of the place before
  // all terms, comes first. Fields of one name come not before each other.
  TermOrders OrdersBefore(int32_t left, int32_t right) const;

 private:
  struct Ranks {
    uint32_t by_code_points;
    uint32_t by_utf16;
  };
  std::vector<Ranks> ranks_;  // by field number
};

}  // namespace vantrel::elastic::format
