#include "elastic/common/quoted.h"

#include "elastic/common/text.h"

namespace vantrel::elastic {

std::string Quoted(std::string_view name) {
  constexpr size_t kMostBytes = 80;
  constexpr char kHexDigits[] = "0123456789abcdef";
  const bool is_text = IsValidUtf8(name);
  std::string quoted = "\"";
  for (const char c : name) {
    const auto byte = static_cast<unsigned char>(c);
    const bool may_cut = !is_text || (byte & 0xc0) != 0x80;  // text is not cut within a character
    if (quoted.size() >= kMostBytes && may_cut) return quoted + "...\"";
    const bool is_plain = byte >= 0x80 ? is_text : byte >= 0x20 && byte != 0x7f && c != '"' && c != '\\';
    if (is_plain) {
      quoted += c;
    } else {
      quoted += {'\\', 'x', kHexDigits[byte >> 4], kHexDigits[byte & 0xf]};
    }
  }
  return quoted + "\"";
}

}  // namespace vantrel::elastic
