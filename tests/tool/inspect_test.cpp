// Pieces of the tool, apart from the program.

#include "error/report_lucene_errors.h"

#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <iostream>
#include <stdexcept>

#include "inspect/utf8_text.h"
#include "option_set.h"

namespace {

TEST(ReportLuceneErrorsTest, LetsOtherKindsOfExceptionsPass) {
  EXPECT_THROW(ReportLuceneErrors([] { throw 42; }), int);
}

TEST(ReportLuceneErrorsTest, ReportsAStandardExceptionAfterWhatWasPrinted) {
  testing::internal::CaptureStdout();
  ReportLuceneErrors([] {
    std::cout << "pos: 1" << std::endl;
    throw std::out_of_range("too far");
  });
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "pos: 1\nException:too far\n");
}

TEST(OptionSetTest, HasItsDefaultsBeforeAnyOptionIsRead) {
  const OptionSet options;
  EXPECT_EQ(options.ndoc, 0);
  EXPECT_EQ(OptionSet::max, 1000);
  EXPECT_EQ(OptionSet::size, 10);
  EXPECT_EQ(OptionSet::offset, 0);
  EXPECT_FALSE(OptionSet::info);
  EXPECT_EQ(OptionSet::field, "");
}

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
