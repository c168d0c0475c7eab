#include "elastic/search/range_filter.h"

#include <charconv>
#include <cmath>
#include <limits>
#include <system_error>
#include <utility>

#include "elastic/search/field_filter.h"

namespace vantrel::elastic {
namespace {

static_assert(std::numeric_limits<Number>::digits >= 64);

using Verdict = JudgedTermsFilter::Verdict;

template <typename T>
bool IsBelow(const Range<T>& range, const T& value) {
  if (!range.from.has_value()) return false;
  return value < *range.from || (value == *range.from && !range.includes_lower);
}

template <typename T>
bool IsAbove(const Range<T>& range, const T& value) {
  if (!range.to.has_value()) return false;
  return value > *range.to || (value == *range.to && !range.includes_upper);
}

}  // namespace

std::optional<Number> ParseNumber(const std::wstring& text) {
  std::string narrow;
  for (const wchar_t character : text) {
    if (character <= 0 || character > 0x7f) return std::nullopt;
    narrow += static_cast<char>(character);
  }
  Number number = 0;
  const char* const end = narrow.data() + narrow.size();
  const auto [parsed_end, error] = std::from_chars(narrow.data(), end, number);
  const bool is_number = error == std::errc() && parsed_end == end && std::isfinite(number);
  return is_number ? std::optional(number) : std::nullopt;
}

Lucene::FilterPtr NewTextRangeFilter(const std::wstring& field, const Range<std::wstring>& range) {
  const auto judge = [range](const std::wstring& term) {
    if (IsAbove(range, term)) return Verdict::kEnd;
    return IsBelow(range, term) ? Verdict::kPassOver : Verdict::kTake;
  };
  return Lucene::newLucene<JudgedTermsFilter>(field, range.from.value_or(L""), judge);
}

Lucene::FilterPtr NewNumberRangeFilter(const std::wstring& field, const Range<Number>& range) {
  const auto judge = [range](const std::wstring& term) {
    const std::optional<Number> number = ParseNumber(term);
    const bool is_inside = number.has_value() && !IsBelow(range, *number) && !IsAbove(range, *number);
    return is_inside ? Verdict::kTake : Verdict::kPassOver;
  };
  return Lucene::newLucene<JudgedTermsFilter>(field, std::wstring(), judge);
}

}  // namespace vantrel::elastic
