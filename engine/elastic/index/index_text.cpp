#include "elastic/index/index_text.h"

#include "elastic/common/text.h"

namespace vantrel::elastic {

const char* ToIndexText(std::string_view text, std::wstring& out) {
  out.clear();
  if (!AppendCodePoints(text, out)) return "is not valid UTF-8";
  for (const wchar_t character : out) {
    if (character == 0xfffe) return "holds U+FFFE, which an index cannot keep";
    if (character == 0xffff) return "holds U+FFFF, which an index cannot keep";
    if (character == 0x1ffff) return "holds U+1FFFF, which an index cannot keep";
  }
  return nullptr;
}

}  // namespace vantrel::elastic
