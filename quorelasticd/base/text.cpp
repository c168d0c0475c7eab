#include "base/text.h"

namespace quorelasticd {

std::string ToOneLine(std::string_view text) {
  std::string line;
  line.reserve(text.size());
  while (!text.empty()) {
    const size_t well_formed = WellFormedLength(text);
    for (const char c : text.substr(0, well_formed)) {
      const auto byte = static_cast<unsigned char>(c);
      line += byte < 0x20 || byte == 0x7f ? ' ' : c;
    }
    text.remove_prefix(well_formed);
    if (text.empty()) break;
    line += "\xef\xbf\xbd";
    text.remove_prefix(1);
  }
  return line;
}

}  // namespace quorelasticd
