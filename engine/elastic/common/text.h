#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace vantrel::elastic {

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

// Well-formed where `code_point` is one, and no surrogate.
void AppendUtf8(char32_t code_point, std::string& out);

// Well-formed UTF-8: shortest forms only, no surrogates, nothing above U+10FFFF.
bool IsValidUtf8(std::string_view text);

// How many leading bytes of `text` are well-formed UTF-8, up to the end of a whole character.
size_t WellFormedLength(std::string_view text);

// Well-formed UTF-8 that the index library can keep: it takes U+FFFE and U+FFFF for errors and loses the whole text
// over them, and U+1FFFF for the text's end.
bool IsKeptText(std::string_view text);

// How many leading bytes of `text`, which is well-formed, lie before the first character that the library does not
// keep; all of them where there is none.
size_t KeptLength(std::string_view text);

// IsValidUtf8 for a text that comes in pieces, which may cut a character in two. For one thread at a time.
class Utf8Scanner {
 public:
  // False once the text is ill-formed; what is missing of a last character is for the next piece.
  bool Take(std::span<const uint8_t> piece);

  // Whether the pieces so far end with a whole character.
  bool IsComplete() const { return held_count_ == 0; }

 private:
  bool CompleteHeld(std::span<const uint8_t>& piece);

  std::array<uint8_t, 4> held_{};  // the beginning of a character
  size_t held_count_ = 0;
};

// Appends the code points of `text` to `out`; false, with `out` half filled, where it is not well-formed.
bool AppendCodePoints(std::string_view text, std::wstring& out);

inline bool IsHighSurrogate(char32_t unit) { return unit >= 0xd800 && unit <= 0xdbff; }
inline bool IsLowSurrogate(char32_t unit) { return unit >= 0xdc00 && unit <= 0xdfff; }

// UTF-16 to UTF-8; a surrogate without its partner becomes U+FFFD.
void AppendUtf16(std::u16string_view units, std::string& out);
std::string FromUtf16(std::u16string_view units);

}  // namespace vantrel::elastic
