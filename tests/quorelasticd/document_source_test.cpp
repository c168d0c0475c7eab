#include "commands/document_source.h"

#include <gtest/gtest.h>

#include <optional>
#include <string>

#include "support/files.h"
#include "support/temporary_folder.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::TemporaryFolder;
using quorelastic::testing::WriteFile;

// A file with a document in every line but each seventh, which is none.
class ImportedDocumentsTest : public ::testing::Test {
 protected:
  ImportedDocumentsTest() {
    for (int line = 1; line <= kLines; ++line) {
      text_ += line % 7 == 0 ? "oops\n" : R"({"id":")" + std::to_string(line) + "\"}\n";
    }
    WriteFile(folder_ / "lines", text_);
  }

  static constexpr int kLines = 60000;
  TemporaryFolder folder_;
  std::string text_;
};

TEST_F(ImportedDocumentsTest, ComeInTheirOrderAndTellHowFarTheyAre) {
  const auto source = ImportedDocuments(folder_.path(), "lines");
  uint64_t bytes = 0;
  for (int line = 1; line <= kLines; ++line) {
    const std::optional<DocumentSource::Item> item = source->Next();
    ASSERT_TRUE(item.has_value()) << line;
    ASSERT_EQ(item->position, static_cast<uint64_t>(line));
    ASSERT_EQ(item->problem.empty(), line % 7 != 0) << line;
    if (item->problem.empty()) {
      ASSERT_EQ(item->document.fields.at(0).value, std::to_string(line));
    }
    Json::Value progress;
    source->DescribeProgress(progress);
    ASSERT_GE(progress["bytes"].asUInt64(), bytes);
    bytes = progress["bytes"].asUInt64();
    ASSERT_EQ(progress["total_bytes"].asUInt64(), text_.size());
  }
  EXPECT_EQ(bytes, text_.size());
  EXPECT_FALSE(source->Next().has_value());
  EXPECT_FALSE(source->Next().has_value());
}

TEST_F(ImportedDocumentsTest, MayBeGivenUpMidway) {
  for (const int taken : {0, 1, 150, kLines}) {
    const auto source = ImportedDocuments(folder_.path(), "lines");
    for (int i = 0; i < taken; ++i) ASSERT_TRUE(source->Next().has_value());
  }
}

}  // namespace
}  // namespace quorelasticd
