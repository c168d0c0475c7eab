#include "base/text.h"

#include <cstdint>

namespace quorelasticd {
namespace {

constexpr size_t kLongestQuote = 80;

// The length of the well-formed character that `text`, not empty, begins with; 0 where there is none.
size_t CharacterLength(std::string_view text) {
  const auto byte = [&](size_t at) { return at < text.size() ? static_cast<uint8_t>(text[at]) : uint8_t{0}; };
  const auto follows = [&](size_t at, uint8_t low = 0x80, uint8_t high = 0xbf) {
    return byte(at) >= low && byte(at) <= high;
  };
  const uint8_t lead = byte(0);
  if (lead < 0x80) return 1;
  if (lead >= 0xc2 && lead <= 0xdf) return follows(1) ? 2 : 0;
  if (lead >= 0xe0 && lead <= 0xef) {
    const uint8_t low = lead == 0xe0 ? 0xa0 : 0x80;   // below: not the shortest form
    const uint8_t high = lead == 0xed ? 0x9f : 0xbf;  // above: surrogates
    return follows(1, low, high) && follows(2) ? 3 : 0;
  }
  if (lead >= 0xf0 && lead <= 0xf4) {
    const uint8_t low = lead == 0xf0 ? 0x90 : 0x80;
    const uint8_t high = lead == 0xf4 ? 0x8f : 0xbf;  // above: past U+10FFFF
    return follows(1, low, high) && follows(2) && follows(3) ? 4 : 0;
  }
  return 0;
}

}  // namespace

size_t FindInvalidUtf8(std::string_view text) {
  for (size_t at = 0; at < text.size();) {
    const size_t length = CharacterLength(text.substr(at));
    if (length == 0) return at;
    at += length;
  }
  return std::string_view::npos;
}

std::string ToOneLine(std::string_view text) {
  std::string line;
  line.reserve(text.size());
  while (!text.empty()) {
    const size_t length = CharacterLength(text);
    const auto lead = static_cast<uint8_t>(text.front());
    if (length == 0) {
      line += "\xef\xbf\xbd";
    } else if (lead < 0x20 || lead == 0x7f) {
      line += ' ';
    } else {
      line += text.substr(0, length);
    }
    text.remove_prefix(length == 0 ? 1 : length);
  }
  return line;
}

std::string Quoted(std::string_view name) {
  bool is_cut = false;
  if (name.size() > kLongestQuote) {
    size_t end = kLongestQuote;
    while (end > kLongestQuote - 4 && (static_cast<uint8_t>(name[end]) & 0xc0) == 0x80) --end;
    name = name.substr(0, end);
    is_cut = true;
  }
  return '"' + ToOneLine(name) + (is_cut ? "...\"" : "\"");
}

}  // namespace quorelasticd
