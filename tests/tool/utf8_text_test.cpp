#include "inspect/utf8_text.h"

#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

namespace {

TEST(AppendUtf8Test, SaysWhatTheIndexLibrarySays) {
  for (const Lucene::String& text :
       {Lucene::String(L""), Lucene::String(L"plain"), Lucene::String(L"a\0b", 3), Lucene::String(L"\u00e9"),
        Lucene::String(L"a\u4e2d\U0001f600z"), Lucene::String(L"\x7f\x80")}) {
    std::string out = "before ";
    AppendUtf8(text, out);
    EXPECT_EQ(out, "before " + Lucene::StringUtils::toUTF8(text));
  }
}

}  // namespace
