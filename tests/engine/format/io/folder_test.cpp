#include "elastic/format/io/folder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/term_cursor.h"
#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/memory_folder.h"
#include "support/temporary_folder.h"
#include "support/without_rights.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ContentOf;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WithoutRights;
using ::quorelastic::testing::WriteFile;
using ::testing::UnorderedElementsAre;

TEST(DiskFolderTest, ListsAndOpensItsFilesWhateverTheirNames) {
  const TemporaryFolder folder;
  WriteFile(folder / "a", "one");
  WriteFile(folder / "\xff\xfe", "two");
  WriteFile(folder / "empty", "");
  const DiskFolder disk(folder.path());
  EXPECT_THAT(disk.List(), UnorderedElementsAre("a", "\xff\xfe", "empty"));
  EXPECT_TRUE(disk.Exists("\xff\xfe"));
  EXPECT_FALSE(disk.Exists("b"));
  EXPECT_EQ(ContentOf(*disk.Open("a")), "one");
  EXPECT_EQ(ContentOf(*disk.Open("\xff\xfe")), "two");
  EXPECT_EQ(ContentOf(*disk.Open("empty")), "");
  EXPECT_EQ(disk.Open("a")->name(), folder / "a");
  EXPECT_EQ(DiskFolder(folder.path() + "/").Open("a")->name(), folder / "a");
}

TEST(DiskFolderTest, ListsNoFoldersAndNoLinksToThem) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "");
  std::filesystem::create_directory(folder / "segments_old");
  std::filesystem::create_directory_symlink(folder / "segments_old", folder / "link_to_folder");
  std::filesystem::create_symlink(folder / "file", folder / "link_to_file");
  std::filesystem::create_symlink(folder / "nowhere", folder / "dangling");
  EXPECT_THAT(DiskFolder(folder.path()).List(), UnorderedElementsAre("file", "link_to_file", "dangling"));
}

TEST(DiskFolderTest, SaysWhichFolderItCannotOpenAndWhy) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "");
  ExpectIndexError(folder / "none: cannot open index folder: No such file",
                   [&] { DiskFolder(folder / "none"); });
  ExpectIndexError(folder / "file: cannot open index folder: Not a directory",
                   [&] { DiskFolder(folder / "file"); });
  ExpectIndexError("(empty path): cannot open index folder", [&] { DiskFolder(""); });
  ExpectIndexError("cannot open index folder: File name too long",
                   [&] { DiskFolder(std::string(5000, 'x')); });
}

TEST(DiskFolderTest, APathIsNotCutAtAZeroByte) {
  const TemporaryFolder folder;
  ExpectIndexError(folder.path() + ": path goes on after a zero byte: No such file",
                   [&] { DiskFolder(folder.path() + std::string("\0hidden", 7)); });
}

TEST(DiskFolderTest, SaysWhichFileItCannotOpenAndWhy) {
  const TemporaryFolder folder;
  std::filesystem::create_directory(folder / "folder");
  std::filesystem::create_symlink("loop", folder / "loop");
  std::filesystem::create_symlink("nowhere", folder / "dangling");
  const DiskFolder disk(folder.path());
  ExpectIndexError(folder / "none: cannot open file: No such file", [&] { disk.Open("none"); });
  ExpectIndexError(folder / "folder: cannot open file: Is a directory", [&] { disk.Open("folder"); });
  ExpectIndexError(folder / "loop: cannot open file: Too many levels", [&] { disk.Open("loop"); });
  ExpectIndexError(folder / "dangling: cannot open file: No such file", [&] { disk.Open("dangling"); });
}

TEST(DiskFolderTest, SaysWhichFileOrFolderItMayNotRead) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "content");
  std::filesystem::create_directory(folder / "folder");
  std::filesystem::permissions(folder.path(), std::filesystem::perms(0755));
  std::filesystem::permissions(folder / "file", std::filesystem::perms::none);
  std::filesystem::permissions(folder / "folder", std::filesystem::perms::none);
  {
    const WithoutRights rights;
    ExpectIndexError(folder / "file: cannot open file: Permission denied",
                     [&] { DiskFolder(folder.path()).Open("file"); });
    ExpectIndexError(folder / "folder: cannot list index folder: Permission denied",
                     [&] { static_cast<void>(DiskFolder(folder / "folder").List()); });
  }
  std::filesystem::permissions(folder / "folder", std::filesystem::perms(0755));
}

TEST(DiskFolderTest, OpensNeitherPipesNorSocketsNorDevices) {
  const TemporaryFolder folder;
  ASSERT_EQ(mkfifo((folder / "pipe").c_str(), 0600), 0);
  std::filesystem::create_symlink("/dev/zero", folder / "device");
  const int listener = socket(AF_UNIX, SOCK_STREAM, 0);
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strncpy(address.sun_path, (folder / "socket").c_str(), sizeof(address.sun_path) - 1);
  ASSERT_EQ(bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof(address)), 0);
  const DiskFolder disk(folder.path());
  for (const char* name : {"pipe", "device", "socket"}) {
    ExpectIndexError(folder / name + ": not a regular file", [&] { disk.Open(name); });
  }
  close(listener);
}

TEST(DiskFolderTest, FollowsASymbolicLinkToAFile) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "content");
  std::filesystem::create_symlink("file", folder / "link");
  EXPECT_EQ(ContentOf(*DiskFolder(folder.path()).Open("link")), "content");
}

TEST(DiskFolderTest, AnOpenFileStaysReadableWhenItIsDeletedOrReplaced) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "content");
  const auto source = DiskFolder(folder.path()).Open("file");
  std::filesystem::remove(folder / "file");
  WriteFile(folder / "file", "new");
  EXPECT_EQ(ContentOf(*source), "content");
}

TEST(DiskFolderTest, AFileThatShrinksWhileItIsReadIsAnErrorNotASignal) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", std::string(100'000, 'x'));
  const auto source = DiskFolder(folder.path()).Open("file");
  ByteReader reader(source, 1024);
  EXPECT_EQ(reader.ReadByte(), 'x');
  std::filesystem::resize_file(folder / "file", 50'000);
  reader.Skip(60'000);
  ExpectIndexError(folder / "file: file shrank to", [&] { reader.ReadByte(); });
  reader.Seek(10);
  EXPECT_EQ(reader.ReadByte(), 'x');
}

TEST(DiskFolderTest, AFileThatGrowsWhileItIsReadKeepsItsLength) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "123");
  const auto source = DiskFolder(folder.path()).Open("file");
  WriteFile(folder / "file", "12345");
  EXPECT_EQ(source->size(), 3U);
  EXPECT_EQ(ContentOf(*source), "123");
}

TEST(DiskFolderTest, AHoleOfATebibyteIsNeitherReadNorHeld) {
  const TemporaryFolder folder;
  WriteFile(folder / "_0.tis", ByteWriter().Int(-4).Long(int64_t{1} << 37).Int(128).Int(16).Int(10).bytes());
  std::error_code error;
  std::filesystem::resize_file(folder / "_0.tis", uint64_t{1} << 40, error);
  if (error) GTEST_SKIP() << "no file of 1 TiB on this file system: " << error.message();
  TermCursor cursor(DiskFolder(folder.path()).Open("_0.tis"), TermCursor::File::kDictionary, 1, 1);
  EXPECT_EQ(cursor.count(), uint64_t{1} << 37);
  ExpectDamage(24, "term is in 0 documents", [&] { cursor.Next(); });
}

}  // namespace
}  // namespace vantrel::elastic::format
