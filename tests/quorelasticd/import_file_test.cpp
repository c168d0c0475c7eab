#include "data_root/import_file.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <string>
#include <vector>

#include "base/limits.h"
#include "errors/request_error.h"
#include "support/files.h"
#include "support/temporary_folder.h"

namespace quorelasticd {
namespace {

namespace fs = std::filesystem;
using quorelastic::testing::TemporaryFolder;
using quorelastic::testing::WriteFile;
using ::testing::ElementsAre;

// A folder to import from, and a secret beside it.
class ImportFileTest : public ::testing::Test {
 protected:
  ImportFileTest() : folder_(base_ / "import") {
    fs::create_directory(folder_);
    WriteFile(base_ / "secret", "secret\n");
  }

  std::vector<std::string> Lines(const std::string& bytes) {
    WriteFile(folder_ + "/file", bytes);
    ImportFile file(folder_, "file");
    std::vector<std::string> lines;
    while (const auto line = file.Next()) {
      EXPECT_EQ(line->number, lines.size() + 1);
      lines.push_back(line->is_too_long ? "(too long)" : std::string(line->text));
    }
    EXPECT_EQ(file.bytes_read(), bytes.size());
    EXPECT_EQ(file.total_bytes(), bytes.size());
    return lines;
  }

  std::string Refusal(const std::string& name) {
    try {
      ImportFile file(folder_, name);
      return "";
    } catch (const RequestError& error) {
      EXPECT_EQ(error.code(), ErrorCode::kBadRequest);
      return error.reason();
    }
  }

  TemporaryFolder base_;
  std::string folder_;
};

TEST_F(ImportFileTest, IsReadLineByLine) {
  EXPECT_THAT(Lines(""), ElementsAre());
  EXPECT_THAT(Lines("\n"), ElementsAre(""));
  EXPECT_THAT(Lines("a\n\nb\n"), ElementsAre("a", "", "b"));
  EXPECT_THAT(Lines("a\nb"), ElementsAre("a", "b"));
  EXPECT_THAT(Lines("a\r\n"), ElementsAre("a\r"));
}

TEST_F(ImportFileTest, LinesMayCrossEveryPieceThatIsRead) {
  std::string bytes;
  std::vector<std::string> expected;
  for (size_t length = 0; length < 1500; ++length) {
    expected.push_back(std::string(length, static_cast<char>('a' + length % 26)));
    bytes += expected.back() + "\n";
  }
  expected.push_back(std::string(900000, 'z'));
  bytes += expected.back();
  EXPECT_EQ(Lines(bytes), expected);
}

TEST_F(ImportFileTest, ALineThatIsTooLongCostsOnlyItself) {
  const std::string longest(kLongestImportLine, 'x');
  EXPECT_THAT(Lines("a\n" + longest + "x\nb\n"), ElementsAre("a", "(too long)", "b"));
  EXPECT_THAT(Lines(longest + "xxx"), ElementsAre("(too long)"));
  EXPECT_EQ(Lines(longest + "\n").front().size(), kLongestImportLine);
}

TEST_F(ImportFileTest, MayLieInAFolderWithin) {
  fs::create_directories(folder_ + "/a/b");
  WriteFile(folder_ + "/a/b/file", "x");
  EXPECT_EQ(Refusal("a/b/file"), "");
}

TEST_F(ImportFileTest, NoPathLeadsOut) {
  for (const std::string& name : {std::string("../secret"), std::string("/etc/passwd"), base_ / "secret",
                                  std::string("a/../../secret"), std::string("./file"), std::string(""),
                                  std::string("a//b"), std::string("a/"), std::string("file\0x", 6)}) {
    fs::create_directories(folder_ + "/a");
    EXPECT_NE(Refusal(name).find("expected a path below the import folder"), std::string::npos)
        << name << Refusal(name);
  }
}

TEST_F(ImportFileTest, NoLinkIsFollowed) {
  fs::create_symlink(base_ / "secret", folder_ + "/link");
  fs::create_directory_symlink(base_.path(), folder_ + "/out");
  WriteFile(folder_ + "/real", "x");
  fs::create_symlink(folder_ + "/real", folder_ + "/inner");
  for (const char* name : {"link", "out/secret", "inner"}) {
    EXPECT_NE(Refusal(name).find("leads over a link or a file"), std::string::npos) << name << Refusal(name);
  }
}

TEST_F(ImportFileTest, OnlyRegularFilesAreTaken) {
  fs::create_directory(folder_ + "/folder");
  ASSERT_EQ(mkfifo((folder_ + "/pipe").c_str(), 0600), 0);
  EXPECT_NE(Refusal("folder").find("is no regular file"), std::string::npos);
  EXPECT_NE(Refusal("pipe").find("is no regular file"), std::string::npos);
  EXPECT_NE(Refusal("missing").find("not in the import folder"), std::string::npos);
  EXPECT_NE(Refusal("missing/file").find("not in the import folder"), std::string::npos);
}

}  // namespace
}  // namespace quorelasticd
