#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vantrel::elastic::format {

// The texts of index files: UTF-8 since the dictionaries of version -4, before that UTF-16 code units, each
// written on its own in one to three bytes.

// The longest text that is believed, in bytes or code units. The library cuts terms at 64 KiB; a longer text is
// no different to a reader, but past this a hole in a damaged file would be taken for gigabytes of text.
inline constexpr uint32_t kLongestText = uint32_t{16} << 20;

// Well-formed UTF-8: shortest forms only, no surrogates, nothing above U+10FFFF.
bool IsValidUtf8(std::string_view text);

// Appends the code points of `text` to `out`; false, with `out` half filled, where it is not well-formed.
bool AppendCodePoints(std::string_view text, std::wstring& out);

// UTF-16 to UTF-8; a surrogate without its partner becomes U+FFFD.
std::string FromUtf16(std::u16string_view units);

}  // namespace vantrel::elastic::format
