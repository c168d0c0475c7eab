// The inspecting actions beside a writer, and what they leave behind: nothing.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <atomic>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include "support/files.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::EndsWith;
using Vector = LibraryField::Vector;

// Adds, deletes, commits and merges without pause. Whatever it has done, document 0 is the one that it began
// with.
class BusyWriter {
 public:
  explicit BusyWriter(const std::string& path) : index_(path) {
    index_.Add({Keyword("id", "first"), VectorText("body", "always here always", Vector::kPositions)});
    index_.Commit();
    thread_ = std::thread([this] {
      while (!stop_) WriteOnce();
    });
  }

  ~BusyWriter() {
    stop_ = true;
    thread_.join();
  }

  int commits() const { return commits_; }

 private:
  void WriteOnce() {
    const int commit = ++commits_;
    const auto number = [](int n) { return std::to_string(n); };
    index_.Add(
        {Keyword("id", number(commit)), VectorText("body", "always n" + number(commit), Vector::kTerms)});
    if (commit > 3) index_.Delete("id", number(commit - 3));
    index_.Commit();
    if (commit % 5 == 0) {
      index_.Optimize();
      index_.Commit();
    }
  }

  LibraryIndex index_;
  std::atomic<int> commits_ = 0;
  std::atomic<bool> stop_ = false;
  std::thread thread_;
};

// Whether a listing is of one moment: the counts agree with the terms listed, and what was always there is
// there once.
::testing::AssertionResult IsWhole(const std::string& listing) {
  size_t total = 0;
  size_t announced = 0;
  size_t listed = 0;
  for (const std::string& line : LinesWithEnds(listing)) {
    if (line.starts_with("segment: ")) announced += std::stoul(line.substr(line.rfind(' ')));
    if (line.starts_with("field: ")) ++listed;
    if (line.starts_with("total terms: ")) total = std::stoul(line.substr(line.rfind(' ')));
  }
  const size_t first =
      CountLines(listing, "field: id text: first\n") + CountLines(listing, "field: body text: here\n");
  if (total == announced && total == listed && first == 2) return ::testing::AssertionSuccess();
  return ::testing::AssertionFailure() << listing;
}

class IndexInUseTest : public ::testing::Test {
 protected:
  static constexpr int kRounds = 60;

  // A run that came too late for a file may fail, but has to say for which.
  static bool NamesAFile(const std::string& text, const std::string& folder) {
    return text.find(folder + "/") != std::string::npos;
  }

  TemporaryFolder folder_;
};

TEST_F(IndexInUseTest, IsShownAsOfOneMomentByTheTermDumps) {
  const BusyWriter writer(folder_.path());
  const int commits = writer.commits();
  int failures = 0;
  for (int round = 0; round < kRounds; ++round) {
    for (const char* action : {"allterm", "term"}) {
      const RunResult run = Inspect(action, folder_.path(), {"-i", "-m", "1000000"});
      if (run.status == 0) {
        EXPECT_EQ(run.err, "");
        EXPECT_THAT(run.out, EndsWith("suggest divisor:1\n"));
        EXPECT_TRUE(IsWhole(run.out));
      } else {
        ++failures;
        EXPECT_EQ(run.signal, SIGABRT) << run;
        EXPECT_TRUE(NamesAFile(run.err, folder_.path())) << run;
      }
    }
  }
  EXPECT_LE(failures, kRounds * 2 / 50);
  EXPECT_GT(writer.commits(), commits + kRounds / 4) << "the writer stood still";
  RecordProperty("failures", failures);
}

TEST_F(IndexInUseTest, AnswersLookupsInFull) {
  const BusyWriter writer(folder_.path());
  const int commits = writer.commits();
  int failures = 0;
  const auto expect = [&](const RunResult& run, const std::string& expected) {
    EXPECT_EQ(run.status, 0) << run;
    EXPECT_EQ(run.err, "");
    if (run.out == expected) return;
    ++failures;
    EXPECT_TRUE(run.out.starts_with("LuceneException: ") && NamesAFile(run.out, folder_.path())) << run;
  };
  for (int round = 0; round < kRounds; ++round) {
    expect(Inspect("position", folder_.path(), {"-f", "body", "-t", "always"}),
           "pos: 0\npos: 2\ndoc: 0 freq: 2\n");
    expect(Inspect("doc_term", folder_.path(), {"-f", "body"}), "body: always\nbody: here\n");
  }
  EXPECT_LE(failures, kRounds * 2 / 50);
  EXPECT_GT(writer.commits(), commits + kRounds / 4) << "the writer stood still";
  RecordProperty("failures", failures);
}

struct FileState {
  ino_t inode;
  off_t size;
  mode_t mode;
  int64_t modified;  // nanoseconds
  int64_t changed;

  friend bool operator==(const FileState&, const FileState&) = default;
};

// The folder itself, as ".", and all that is in it.
std::map<std::string, FileState> Examine(const std::string& folder) {
  std::map<std::string, FileState> states;
  std::vector<std::string> names = ListFolder(folder);
  names.emplace_back(".");
  const auto nanoseconds = [](const timespec& time) { return time.tv_sec * 1'000'000'000 + time.tv_nsec; };
  for (const std::string& name : names) {
    struct stat status {};
    EXPECT_EQ(lstat((folder + "/" + name).c_str(), &status), 0);
    states[name] = {status.st_ino, status.st_size, status.st_mode, nanoseconds(status.st_mtim),
                    nanoseconds(status.st_ctim)};
  }
  return states;
}

TEST_F(IndexInUseTest, IsLeftAsItWas) {
  for (const bool compound : {true, false}) {
    const std::string path = folder_ / (compound ? "compound" : "plain");
    {
      LibraryIndex index(path, {.compound = compound});
      index.Add({VectorText("body", "word here", Vector::kTerms)});
      index.Commit();
      index.Add({VectorText("body", "word there", Vector::kTerms)});
      index.Commit();
      index.Delete("body", "there");
    }
    WriteFile(path + "/segments_0", "cut short");
    WriteFile(path + "/_9.cfs", "left by a writer that died");
    const auto before = Examine(path);
    const std::vector<std::string> beside = ListFolder(folder_.path());
    for (const char* action : {"allterm", "term", "position", "doc_term", "plugin"}) {
      const RunResult run = Inspect(action, path, {"-i", "-f", "body", "-t", "word"}, {.folder = path});
      EXPECT_EQ(run.status, 0) << run;
      EXPECT_EQ(Examine(path), before) << action;
    }
    EXPECT_EQ(ListFolder(folder_.path()), beside);
  }
}

TEST_F(IndexInUseTest, NeedsNoLockOfTheWriter) {
  LibraryIndex index(folder_.path());
  index.Add({VectorText("body", "word", Vector::kTerms)});
  index.Commit();
  index.Add({VectorText("body", "uncommitted", Vector::kTerms)});
  ASSERT_THAT(ListFolder(folder_.path()), ::testing::Contains("write.lock"));
  EXPECT_THAT(Inspect("allterm", folder_.path()),
              Printed("segment: _0, terms count: 1\ntotal terms: 1\nsuggest divisor:1\n"));
  EXPECT_THAT(Inspect("position", folder_.path(), {"-f", "body", "-t", "word"}),
              Printed("pos: 0\ndoc: 0 freq: 1\n"));
  EXPECT_THAT(Inspect("position", folder_.path(), {"-f", "body", "-t", "uncommitted"}),
              Printed("No entry!!\n"));
  EXPECT_THAT(Inspect("doc_term", folder_.path(), {"-f", "body"}), Printed("body: word\n"));
}

}  // namespace
}  // namespace quorelastic::testing
