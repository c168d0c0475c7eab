#include "elastic/preproc/lower_case.h"

#include <unicode/uchar.h>

#include "elastic/common/text.h"

namespace vantrel::elastic {
namespace {

constexpr char32_t kAsciiEnd = 0x80;

char LowerCaseAscii(char letter) {
  return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

}  // namespace

char32_t LowerCase(char32_t code_point) {
  if (code_point < kAsciiEnd) return static_cast<char32_t>(LowerCaseAscii(static_cast<char>(code_point)));
  return static_cast<char32_t>(u_tolower(static_cast<UChar32>(code_point)));
}

std::string LowerCase(std::string_view text) {
  std::string lower;
  lower.reserve(text.size());
  while (!text.empty()) {
    char32_t code_point = 0;
    if (static_cast<unsigned char>(text.front()) >= kAsciiEnd && TakeCodePoint(text, code_point)) {
      AppendUtf8(LowerCase(code_point), lower);
    } else {
      lower.push_back(LowerCaseAscii(text.front()));
      text.remove_prefix(1);
    }
  }
  return lower;
}

}  // namespace vantrel::elastic
