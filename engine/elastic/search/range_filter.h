#pragma once

#include <lucene++/LuceneHeaders.h>

#include <optional>
#include <string>

namespace vantrel::elastic {

// Holds every 64-bit integer as it is.
using Number = long double;

template <typename T>
struct Range {
  std::optional<T> from;  // without a bound, everything on that side counts in
  std::optional<T> to;
  bool includes_lower = true;
  bool includes_upper = true;
};

// The number that a text is in decimal notation, such as "-12.5" or "1e9"; nothing where it is none.
std::optional<Number> ParseNumber(const std::wstring& text);

// Keep the documents with a value of the field in the range.
Lucene::FilterPtr NewTextRangeFilter(const std::wstring& field, const Range<std::wstring>& range);
Lucene::FilterPtr NewNumberRangeFilter(const std::wstring& field, const Range<Number>& range);

}  // namespace vantrel::elastic
