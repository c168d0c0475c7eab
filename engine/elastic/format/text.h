#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vantrel::elastic::format {

// The texts of index files: UTF-8 since the dictionaries of version -4, before that UTF-16 code units, each
// written on its own in one to three bytes.

// The longest term that is believed, in bytes of UTF-8: the index library writes no more than 16383 characters.
inline constexpr uint32_t kLongestTerm = uint32_t{64} << 10;

// The longest other text, in bytes or UTF-16 code units: names, and terms of the older layouts, which had no
// limit. Past this a hole in a damaged file would be taken for gigabytes of text.
inline constexpr uint32_t kLongestText = uint32_t{1} << 20;

// Decodes the first code point of `text`, which is not empty, and removes it; false, with `text` as it was,
// where it does not begin with well-formed UTF-8.
bool TakeCodePoint(std::string_view& text, char32_t& code_point);

// `code_point` must be one, and no surrogate.
void AppendUtf8(char32_t code_point, std::string& out);

// Well-formed UTF-8: shortest forms only, no surrogates, nothing above U+10FFFF.
bool IsValidUtf8(std::string_view text);

// Appends the code points of `text` to `out`; false, with `out` half filled, where it is not well-formed.
bool AppendCodePoints(std::string_view text, std::wstring& out);

// UTF-16 to UTF-8; a surrogate without its partner becomes U+FFFD.
std::string FromUtf16(std::u16string_view units);

}  // namespace vantrel::elastic::format
