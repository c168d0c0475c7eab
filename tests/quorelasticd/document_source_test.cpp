#include "commands/document_source.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <utility>

#include "support/files.h"
#include "support/temporary_folder.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::TemporaryFolder;
using quorelastic::testing::WriteFile;

// The next item, however long it takes.
std::optional<DocumentSource::Item> Next(DocumentSource& source) {
  DocumentSource::Item item;
  auto move = DocumentSource::Move::kNotYet;
  while (move == DocumentSource::Move::kNotYet) move = source.Next(std::chrono::milliseconds(1), item);
  return move == DocumentSource::Move::kItem ? std::optional(std::move(item)) : std::nullopt;
}

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
    const std::optional<DocumentSource::Item> item = Next(*source);
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
  EXPECT_FALSE(Next(*source).has_value());
  EXPECT_FALSE(Next(*source).has_value());
}

TEST_F(ImportedDocumentsTest, MayBeGivenUpMidway) {
  for (const int taken : {0, 1, 150, kLines}) {
    const auto source = ImportedDocuments(folder_.path(), "lines");
    for (int i = 0; i < taken; ++i) ASSERT_TRUE(Next(*source).has_value());
  }
}

// One line of a terabyte, none of which is on the disk.
TEST_F(ImportedDocumentsTest, ThatAreLongInComingAreNeitherWaitedForNorReadToTheEnd) {
  WriteFile(folder_ / "long", "");
  std::filesystem::resize_file(folder_ / "long", uintmax_t{1} << 40);
  const auto source = ImportedDocuments(folder_.path(), "long");
  DocumentSource::Item item;
  EXPECT_EQ(source->Next(std::chrono::milliseconds(1), item), DocumentSource::Move::kNotYet);
}

}  // namespace
}  // namespace quorelasticd
