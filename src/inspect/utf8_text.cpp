#include "inspect/utf8_text.h"

#include <lucene++/LuceneHeaders.h>

#include <algorithm>

void AppendUtf8(const Lucene::String& text, std::string& out) {
  // ASCII, which is most of what dictionaries hold, is the same in both; the library's conversion takes longer
  // than all else that is done to print a term.
  const auto is_ascii = [](wchar_t c) { return static_cast<unsigned int>(c) < 0x80; };
  if (!std::all_of(text.begin(), text.end(), is_ascii)) {
    out += Lucene::StringUtils::toUTF8(text);
    return;
  }
  const size_t start = out.size();
  out.resize(start + text.size());
  std::transform(text.begin(), text.end(), out.begin() + static_cast<std::ptrdiff_t>(start),
                 [](wchar_t c) { return static_cast<char>(c); });
}
