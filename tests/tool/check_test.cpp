// "check": one word on standard error, nothing on standard output, and nothing done to the index.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <atomic>
#include <filesystem>
#include <map>
#include <string>
#include <thread>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/sandbox_test.h"
#include "support/sanitized.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

auto Clean() { return Ended(0, "", "clean\n"); }
auto NotClean() { return Ended(0, "", "NOT clean\n"); }

void WriteForty(const std::string& path, bool compound) {
  LibraryIndex index(path, {.compound = compound});
  for (int number = 0; number < 40; ++number) {
    index.Add({Keyword("id", std::to_string(number)),
               VectorText("body", "a word and another " + std::to_string(number % 7),
                          LibraryField::Vector::kPositions)});
  }
  index.Commit();
  index.Delete("id", "7");
}

// Everything in a folder, with the times of the last change.
std::map<std::string, std::string> Snapshot(const std::string& folder) {
  std::map<std::string, std::string> files;
  for (const std::string& name : ListFolder(folder)) {
    struct stat status {};
    stat((folder + "/" + name).c_str(), &status);
    files[name] = std::to_string(status.st_mtim.tv_sec) + "." + std::to_string(status.st_mtim.tv_nsec) + " " +
                  ReadFile(folder + "/" + name);
  }
  return files;
}

class CheckTest : public ::testing::Test {
 protected:
  TemporaryFolder folder_;
};

TEST_F(CheckTest, CallsAHealthyIndexClean) {
  for (const bool compound : {false, true}) {
    const std::string path = folder_ / (compound ? "compound" : "plain");
    WriteForty(path, compound);
    const auto before = Snapshot(path);
    EXPECT_THAT(Inspect("check", path), Clean());
    EXPECT_THAT(Inspect("check", path + "/"), Clean());
    EXPECT_EQ(Snapshot(path), before) << "it was changed";
  }
}

TEST_F(CheckTest, CallsACorruptedIndexNotClean) {
  WriteForty(folder_.path(), false);
  const std::string file = folder_ / "_0.frq";
  const std::string bytes = ReadFile(file);
  WriteFile(file, bytes + '\0');
  const auto before = Snapshot(folder_.path());
  EXPECT_THAT(Inspect("check", folder_.path()), NotClean());
  EXPECT_EQ(Snapshot(folder_.path()), before) << "it was changed";
  WriteFile(file, bytes);
  EXPECT_THAT(Inspect("check", folder_.path()), Clean());
}

TEST_F(CheckTest, CallsAFolderWithoutIndexNotClean) {
  EXPECT_THAT(Inspect("check", folder_.path()), NotClean());
  EXPECT_TRUE(ListFolder(folder_.path()).empty());
}

TEST_F(CheckTest, AbortsOverAFolderThatDoesNotExist) {
  const std::string path = folder_ / "missing";
  EXPECT_THAT(Inspect("check", path),
              Aborted("", kIoErrorType, path + ": cannot open index folder: No such file or directory"));
  EXPECT_FALSE(std::filesystem::exists(path));
}

TEST_F(CheckTest, ReadsAPathOfAnyScriptInAnyLocale) {
  const std::string path = folder_ / "größe 中文";
  WriteForty(folder_ / "index", true);
  std::filesystem::rename(folder_ / "index", path);
  for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no such locale"}) {
    EXPECT_THAT(Inspect("check", path, {}, {.environment = {locale}}), Clean()) << locale;
  }
  const std::string no_text = folder_ / "\xff\xfe";
  std::filesystem::rename(path, no_text);
  EXPECT_THAT(Inspect("check", no_text), Clean());
}

TEST_F(CheckTest, NeedsLittleMemory) {
  WriteForty(folder_.path(), true);
  const RunOptions limited{.limits = {{RLIMIT_AS, rlim_t{256} << 20}}};
  // A sanitizer takes more than that for itself.
  const RunResult run = Inspect("check", folder_.path(), {}, limited);
  if (run.err.find("Sanitizer") != std::string::npos)
    GTEST_SKIP() << "a sanitizer needs more memory than the limit";
  EXPECT_THAT(run, Clean());
}

// Each segment takes memory as long as it is under way, also where none of its files is there.
TEST_F(CheckTest, NeedsLittleMemoryForManySegmentsWithoutFiles) {
  if (kIsSanitized) GTEST_SKIP() << "a sanitizer needs more memory than the limit";
  constexpr int kSegments = 30'000;
  ByteWriter commit;
  commit.Int(-4).Long(1).Int(kSegments).Int(kSegments);
  for (int number = 0; number < kSegments; ++number) {
    commit.String("_" + std::to_string(number)).Int(1);
    commit.Long(-1).Int(-1).Byte(1).Int(-1).Byte(-1);  // nothing deleted, nothing shared, no compound file
  }
  WriteFile(folder_ / "segments_1", commit.bytes());
  const RunOptions limited{.limits = {{RLIMIT_AS, rlim_t{256} << 20}}};
  EXPECT_THAT(Inspect("check", folder_.path(), {}, limited), NotClean());
}

TEST_F(CheckTest, IsNotMistakenBesideABusyWriter) {
  LibraryIndex index(folder_.path());
  index.Add({Keyword("id", "first")});
  index.Commit();
  std::atomic<bool> stop = false;
  std::thread writer([&] {
    for (int number = 0; !stop; ++number) {
      index.Add({Keyword("id", std::to_string(number)),
                 VectorText("body", "some words", LibraryField::Vector::kTerms)});
      if (number % 3 == 0) index.Delete("id", std::to_string(number - 3));
      index.Commit();
      if (number % 4 == 0) index.Optimize();
    }
  });
  for (int round = 0; round < 60; ++round) EXPECT_THAT(Inspect("check", folder_.path()), Clean());
  stop = true;
  writer.join();
}

// Without privileges even where the test is run by root.
class UnreadableCheckTest : public SandboxTest {};

TEST_F(UnreadableCheckTest, CallsAnIndexWithAFileThatMayNotBeReadNotClean) {
  Sandbox sandbox;
  const std::string path = sandbox.folder() + "/index";
  WriteForty(path, false);
  EXPECT_THAT(sandbox.RunTool({"-a", "check", "-d", path}), Clean());
  for (const char* name : {"_0.fdt", "_0.tis", "_0.nrm"}) {
    const std::string file = path + "/" + name;
    ASSERT_EQ(chmod(file.c_str(), 0), 0);
    EXPECT_THAT(sandbox.RunTool({"-a", "check", "-d", path}), NotClean()) << name;
    chmod(file.c_str(), 0600);
  }
  ASSERT_EQ(chmod(path.c_str(), 0), 0);
  EXPECT_THAT(sandbox.RunTool({"-a", "check", "-d", path}),
              Aborted("", kIoErrorType, path + ": cannot list index folder: Permission denied"));
  chmod(path.c_str(), 0700);
}

}  // namespace
}  // namespace quorelastic::testing
