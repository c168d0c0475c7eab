// What the inspecting actions say of a path that holds no index they can read. "allterm" and "term" abort
// with an exception that names the path; "position" and "doc_term" report the index library's error and end
// as usual.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>
#include <string>

#include "support/files.h"
#include "support/sandbox_test.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::AllOf;
using ::testing::ContainsRegex;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::StartsWith;

constexpr char kIndexError[] = "vantrel::elastic::IndexError";

const std::vector<std::string> kTermOptions{"-f", "body", "-t", "word", "-i"};

// One line, "LuceneException: " and `text`.
auto Reported(const std::string& text) { return Printed("LuceneException: " + text + "\n"); }

void WriteTwoSegments(const std::string& path, bool compound = true) {
  LibraryIndex index(path, {.compound = compound});
  index.Add({VectorText("body", "word", LibraryField::Vector::kTerms)});
  index.Commit();
  index.Add({VectorText("body", "word again", LibraryField::Vector::kTerms)});
  index.Commit();
  index.Delete("body", "again");
}

// The name of the newest commit's file, whose generation has one digit.
std::string NewestCommit(const std::string& folder) {
  std::string newest;
  for (const std::string& name : ListFolder(folder)) {
    if (name.starts_with("segments_")) newest = std::max(newest, name);
  }
  return newest;
}

class BadIndexTest : public ::testing::Test {
 protected:
  // "allterm" and "term" abort with the exception and its text, the other two report the library's.
  void ExpectRefusal(const std::string& path, const char* exception_type,
                     const ::testing::Matcher<std::string>& what, const std::string& library_text) const {
    for (const char* action : {"allterm", "term"}) {
      EXPECT_THAT(Inspect(action, path, kTermOptions), Aborted("", exception_type, what)) << action;
    }
    for (const char* action : {"position", "doc_term"}) {
      EXPECT_THAT(Inspect(action, path, kTermOptions), Reported(library_text)) << action;
    }
  }

  TemporaryFolder folder_;
};

TEST_F(BadIndexTest, ReportsAMissingFolder) {
  const std::string path = folder_ / "missing";
  ExpectRefusal(path, kIoErrorType, path + ": cannot open index folder: No such file or directory",
                "Directory '" + path + "' does not exist");
  EXPECT_FALSE(std::filesystem::exists(path)) << "the folder was created";
}

TEST_F(BadIndexTest, ReportsALinkThatLeadsNowhere) {
  const std::string path = folder_ / "link";
  std::filesystem::create_symlink("nowhere", path);
  ExpectRefusal(path, kIoErrorType, path + ": cannot open index folder: No such file or directory",
                "Directory '" + path + "' does not exist");
}

TEST_F(BadIndexTest, ReportsAFileInPlaceOfAFolder) {
  const std::string path = folder_ / "file";
  WriteFile(path, "no index");
  ExpectRefusal(path, kIoErrorType, path + ": cannot open index folder: Not a directory",
                "File '" + path + "' exists but is not a directory");
}

TEST_F(BadIndexTest, ReportsAFifoInPlaceOfAFolder) {
  const std::string path = folder_ / "fifo";
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  ExpectRefusal(path, kIoErrorType, path + ": cannot open index folder: Not a directory",
                "File '" + path + "' exists but is not a directory");
}

TEST_F(BadIndexTest, ReportsAFolderWithoutIndex) {
  const std::string nothing_in_it = folder_.path() + ": no index in this folder: it holds no segments file";
  ExpectRefusal(folder_.path(), kIndexError, nothing_in_it, "No segments* file found in directory");
  WriteFile(folder_ / "readme.txt", "no index");
  WriteFile(folder_ / "_0.cfs", "no index either");
  std::filesystem::create_directory(folder_ / "index");
  ExpectRefusal(folder_.path(), kIndexError, nothing_in_it, "No segments* file found in directory");
  EXPECT_EQ(ListFolder(folder_.path()), (std::vector<std::string>{"_0.cfs", "index", "readme.txt"}));
}

TEST_F(BadIndexTest, ReportsAnEmptyPath) {
  for (const char* action : {"allterm", "term"}) {
    EXPECT_THAT(
        Inspect(action, "", kTermOptions),
        Aborted("", kIoErrorType, "(empty path): cannot open index folder: No such file or directory"));
  }
  EXPECT_THAT(Inspect("position", "", kTermOptions), Reported("Directory '' does not exist"));
  EXPECT_THAT(Inspect("doc_term", "", kTermOptions),
              Printed(EndsWith("\nLuceneException: Directory '' does not exist\n")));
}

TEST_F(BadIndexTest, ReportsAPathThatIsTooLong) {
  const std::string path = folder_ / std::string(5000, 'x');
  for (const char* action : {"allterm", "term"}) {
    EXPECT_THAT(Inspect(action, path), Aborted("", kIoErrorType, EndsWith(": File name too long")));
  }
  for (const char* action : {"position", "doc_term"}) {
    EXPECT_THAT(Inspect(action, path, kTermOptions),
                Printed(ContainsRegex("^[A-Za-z]*Exception:.*xxxxx.*\n$")));
  }
}

TEST_F(BadIndexTest, ReportsAMissingFolderOfAnyScript) {
  const std::string path = folder_ / "größe 中文";
  EXPECT_THAT(Inspect("allterm", path),
              Aborted("", kIoErrorType, path + ": cannot open index folder: No such file or directory"));
  for (const char* action : {"position", "doc_term"}) {
    // The stream's locale has no letters for the rest.
    EXPECT_THAT(Inspect(action, path, kTermOptions),
                Printed(AllOf(StartsWith("LuceneException: Directory '" + folder_ / "gr"),
                              EndsWith("' does not exist\n"))));
  }
}

// The index library would take gigabytes, or end in an exception of another kind.
TEST_F(BadIndexTest, ReportsDamageThatTheLibraryWouldFallOver) {
  WriteTwoSegments(folder_.path(), false);
  // The size of the term index, a Long after the format; no container holds a number below nought.
  std::string bytes = ReadFile(folder_ / "_0.tii");
  bytes.replace(4, 8, std::string("\0\0\0\0\x80\0\0\1", 8));
  WriteFile(folder_ / "_0.tii", bytes);
  for (const char* action : {"position", "doc_term"}) {
    EXPECT_THAT(
        Inspect(action, folder_.path(), kTermOptions),
        Reported(folder_ / "_0.tii: offset 4: term count 2147483649 does not fit a file of 35 bytes"));
  }
}

// What the library finds out by itself it says in its own words.
TEST_F(BadIndexTest, LeavesToTheLibraryWhatItFindsOut) {
  WriteTwoSegments(folder_.path(), false);
  const auto expect_reported = [&](const std::string& name, const std::string& bytes, const char* report) {
    SCOPED_TRACE(name);
    const std::string intact = ReadFile(folder_ / name);
    WriteFile(folder_ / name, bytes);
    for (const char* action : {"position", "doc_term"}) {
      EXPECT_THAT(Inspect(action, folder_.path(), kTermOptions), Reported(report));
    }
    WriteFile(folder_ / name, intact);
  };
  const std::string fields = ReadFile(folder_ / "_0.fnm");
  const std::string commit = NewestCommit(folder_.path());
  std::string changed = ReadFile(folder_ / commit);
  changed[11] = static_cast<char>(changed[11] ^ 1);  // of the version, which is any number
  expect_reported(commit, changed, "Checksum mismatch in segments file");
  expect_reported("_0.fnm", fields.substr(0, fields.size() - 1), "Read past EOF");
  expect_reported("_0.tis", std::string("\xff\xff\xff\xfb", 4),
                  "Unknown format version:-5 expected -4 or higher");
  expect_reported("_0.tii", std::string("\xff\xff", 2), "Read past EOF");
}

TEST_F(BadIndexTest, EndsWhereSomethingElseIsInAFilesPlace) {
  WriteTwoSegments(folder_ / "index", false);
  for (const std::string& name : ListFolder(folder_ / "index")) {
    const std::string path = folder_ / "index/" + name;
    std::filesystem::rename(path, folder_ / "aside");
    for (const char* kind : {"fifo", "folder", "device"}) {
      if (kind == std::string("fifo")) {
        ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
      } else if (kind == std::string("folder")) {
        std::filesystem::create_directory(path);
      } else {
        std::filesystem::create_symlink("/dev/zero", path);
      }
      for (const char* action : {"allterm", "term", "position", "doc_term", "check"}) {
        const RunResult run = Inspect(action, folder_ / "index", kTermOptions,
                                      {.limits = {{RLIMIT_CPU, 5}}, .time_limit = std::chrono::seconds(20)});
        const bool may_abort = action != std::string("position") && action != std::string("doc_term");
        EXPECT_TRUE(run.signal == 0 || (may_abort && run.signal == SIGABRT))
            << action << " with a " << kind << " for " << name << ": " << run;
      }
      std::filesystem::remove(path);
    }
    std::filesystem::rename(folder_ / "aside", path);
  }
  EXPECT_THAT(Inspect("position", folder_ / "index", kTermOptions), Printed("pos: 0\ndoc: 0 freq: 1\n"));
}

TEST_F(BadIndexTest, ReportsEveryFileThatIsMissing) {
  WriteTwoSegments(folder_ / "index", false);
  for (const std::string& name : ListFolder(folder_ / "index")) {
    if (name == "segments.gen") continue;
    std::filesystem::rename(folder_ / "index/" + name, folder_ / "aside");
    for (const char* action : {"allterm", "term"}) {
      const RunResult run = Inspect(action, folder_ / "index", kTermOptions);
      if (run.status != 0) {
        EXPECT_EQ(run.signal, SIGABRT) << name;
        EXPECT_THAT(run.err, HasSubstr("\n  what():  " + folder_ / "index")) << name;
      } else {
        EXPECT_THAT(run, Printed(EndsWith("suggest divisor:1\n"))) << name;
      }
    }
    for (const char* action : {"position", "doc_term"}) {
      const RunResult run = Inspect(action, folder_ / "index", kTermOptions);
      EXPECT_EQ(run.status, 0) << name << ": " << run;
      EXPECT_EQ(run.err, "") << name;
    }
    std::filesystem::rename(folder_ / "aside", folder_ / "index/" + name);
  }
}

// Without privileges even where the test is run by root.
class UnreadableIndexTest : public SandboxTest {
 protected:
  void SetUp() override {
    SandboxTest::SetUp();
    if (IsSkipped()) return;
    WriteTwoSegments(path_, false);
  }

  void Forbid(const std::string& path) {
    ASSERT_EQ(chmod(path.c_str(), 0), 0);
    const RunResult attempt = sandbox_.RunCommand({std::filesystem::is_directory(path) ? "ls" : "cat", path});
    ASSERT_THAT(attempt.err, HasSubstr("Permission denied")) << "it can be read all the same";
  }

  RunResult Inspect(const std::string& action) const {
    return sandbox_.RunTool({"-a", action, "-d", path_, "-f", "body", "-t", "word", "-i"});
  }

  Sandbox sandbox_;
  std::string path_ = sandbox_.folder() + "/index";
};

TEST_F(UnreadableIndexTest, ReportsAFolderThatMayNotBeRead) {
  Forbid(path_);
  for (const char* action : {"allterm", "term"}) {
    EXPECT_THAT(Inspect(action),
                Aborted("", kIoErrorType, path_ + ": cannot list index folder: Permission denied"));
  }
  for (const char* action : {"position", "doc_term"}) {
    EXPECT_THAT(Inspect(action), Printed(ContainsRegex("^[A-Za-z]*Exception:.+\n$"))) << action;
  }
  chmod(path_.c_str(), 0700);
}

TEST_F(UnreadableIndexTest, ReportsAFileThatMayNotBeRead) {
  for (const char* ending : {"_0.tis", "_1.tii", "_0.fnm"}) {
    const std::string file = path_ + "/" + ending;
    Forbid(file);
    for (const char* action : {"allterm", "term"}) {
      EXPECT_THAT(Inspect(action), Aborted("", kIoErrorType, file + ": cannot open file: Permission denied"));
    }
    for (const char* action : {"position", "doc_term"}) {
      EXPECT_THAT(Inspect(action), Printed(AllOf(StartsWith("LuceneException: "), HasSubstr(file))))
          << action;
    }
    chmod(file.c_str(), 0600);
  }
  EXPECT_THAT(Inspect("allterm"), Printed(HasSubstr("total terms: 3\n")));
}

TEST_F(UnreadableIndexTest, DoesWithoutTheHintOfTheNewestGeneration) {
  Forbid(path_ + "/segments.gen");
  EXPECT_THAT(Inspect("allterm"), Printed(HasSubstr("total terms: 3\n")));
  EXPECT_THAT(Inspect("position"), Printed("pos: 0\ndoc: 0 freq: 1\n"));
  EXPECT_THAT(Inspect("doc_term"), Printed("body: word\n"));
}

}  // namespace
}  // namespace quorelastic::testing
