#include "data_root/data_root.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>

#include "data_root/index_name.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "support/without_rights.h"

namespace quorelasticd {
namespace {

namespace fs = std::filesystem;
using quorelastic::testing::ListFolder;
using quorelastic::testing::TemporaryFolder;
using quorelastic::testing::WithoutRights;
using quorelastic::testing::WriteFile;
using ::testing::ElementsAre;

TEST(IndexName, IsOnePlainComponent) {
  for (const std::string name : {"a", "0", "wordnet", "a-b_c9", "imports"})
    EXPECT_TRUE(IsIndexName(name)) << name;
  EXPECT_TRUE(IsIndexName(std::string(64, 'x')));
  EXPECT_FALSE(IsIndexName(std::string(65, 'x')));
  for (const std::string name :
       {"", ".", "..", "-a", "_a", "A", "a/b", "/a", "a.b", "a b", "\xc3\xa4", "import", "a\n"}) {
    EXPECT_FALSE(IsIndexName(name)) << name;
  }
  EXPECT_FALSE(IsIndexName(std::string("a\0b", 3)));
}

TEST(DataRoot, IsMadeWithItsImportFolderForNobodyElse) {
  const TemporaryFolder folder;
  const DataRoot root(folder / "data");
  EXPECT_THAT(ListFolder(root.path()), ElementsAre("daemon.lock", "import"));
  for (const std::string& path : {root.path(), root.import_path()}) {
    struct stat status {};
    ASSERT_EQ(stat(path.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07007, 0u) << path;
  }
  EXPECT_THAT(root.ListIndexes(), ElementsAre());
}

TEST(DataRoot, BelongsToOneDaemonAtATime) {
  const TemporaryFolder folder;
  auto first = std::make_unique<DataRoot>(folder.path());
  try {
    const DataRoot second(folder.path());
    FAIL() << "a second one was let in";
  } catch (const std::runtime_error& error) {
    EXPECT_EQ(std::string(error.what()), folder.path() + ": another daemon runs on this data folder");
  }
  first.reset();
  EXPECT_NO_THROW(DataRoot{folder.path()});
}

TEST(DataRoot, CannotBeAFileOrLieNowhere) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "");
  EXPECT_THROW(DataRoot{folder / "file"}, std::runtime_error);
  EXPECT_THROW(DataRoot{folder / "missing/data"}, std::runtime_error);
}

TEST(DataRoot, ListsFoldersThatBearTheNameOfAnIndex) {
  const TemporaryFolder folder;
  const DataRoot root(folder.path());
  for (const char* name : {"zebra", "ant", "Upper", ".hidden"}) fs::create_directory(folder / name);
  WriteFile(folder / "file", "");
  fs::create_directory_symlink(folder / "ant", folder / "link");
  EXPECT_THAT(root.ListIndexes(), ElementsAre("ant", "zebra"));
  EXPECT_TRUE(root.HasIndex("ant"));
  EXPECT_FALSE(root.HasIndex("file"));
  EXPECT_FALSE(root.HasIndex("link"));
}

TEST(DataRoot, AnIndexComesAndGoesByItsName) {
  const TemporaryFolder folder;
  const DataRoot root(folder.path());
  fs::create_directory(root.ClearHiddenPath("x"));
  WriteFile(root.path() + "/.new-x/file", "12345");
  EXPECT_FALSE(root.HasIndex("x"));
  root.ShowIndex("x");
  EXPECT_TRUE(root.HasIndex("x"));
  const std::string hidden = root.HideIndex("x");
  EXPECT_FALSE(root.HasIndex("x"));
  EXPECT_TRUE(fs::exists(hidden + "/file"));
}

TEST(DataRoot, WhatAFailedAttemptLeftIsNotInTheWay) {
  const TemporaryFolder folder;
  const DataRoot root(folder.path());
  fs::create_directory(root.ClearHiddenPath("x"));
  WriteFile(root.path() + "/.new-x/stale", "");
  EXPECT_FALSE(fs::exists(root.ClearHiddenPath("x")));
  fs::create_directories(root.path() + "/.old-y/deep");
  fs::create_directory(root.IndexPath("y"));
  EXPECT_NO_THROW(root.HideIndex("y"));
}

TEST(DataRoot, LeftoversAreSweptAtTheStart) {
  const TemporaryFolder folder;
  fs::create_directories(folder / ".new-x/deep");
  fs::create_directories(folder / ".old-y");
  fs::create_directories(folder / ".other");
  fs::create_directories(folder / "kept");
  const DataRoot root(folder.path());
  EXPECT_THAT(ListFolder(folder.path()), ElementsAre(".other", "daemon.lock", "import", "kept"));
}

TEST(DataRoot, ALeftoverThatCannotBeRemovedKeepsNoDaemonFromStarting) {
  const TemporaryFolder folder;
  fs::permissions(folder.path(), fs::perms::all);
  for (const char* name : {"/.old-a", "/.new-b"}) {
    fs::create_directory(folder.path() + name);
    WriteFile(folder.path() + name + "/file", "");
    fs::permissions(folder.path() + name, fs::perms(0555));
  }
  fs::create_directory(folder / ".old-c");
  {
    const WithoutRights rights;
    EXPECT_NO_THROW(DataRoot{folder.path()});
  }
  EXPECT_THAT(ListFolder(folder.path()), ElementsAre(".new-b", ".old-a", "daemon.lock", "import"));
  for (const char* name : {"/.old-a", "/.new-b"}) fs::permissions(folder.path() + name, fs::perms::all);
}

}  // namespace
}  // namespace quorelasticd
