// Damages every kind of file of small indexes, a fixed sequence of a few thousand cases, and demands that each
// reading ends in the index's terms or in an error that names the file. Once within this process, where it is
// quick, and once through the real program, whose memory and time are limited.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>
#include <sys/wait.h>

#include <cstdlib>
#include <iostream>
#include <optional>

#include "damage/damage.h"
#include "damage/limited_run.h"
#include "support/files.h"
#include "support/random_index.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_info.h"

namespace quorelastic::testing {
namespace {

using vantrel::elastic::IndexDamagedError;
using vantrel::elastic::IndexError;
using vantrel::elastic::IndexInfo;

constexpr int kCasesPerShape = kIsSanitized ? 120 : 280;

struct Shape {
  const char* name;
  RandomIndexShape index;
  const char* older_layout = nullptr;  // written by the older library instead, "plain" or "compound"
};

// What the test runner shows of it.
void PrintTo(const Shape& shape, std::ostream* out) { *out << shape.name; }

// In all of them the dictionary's index has several entries, and every reading has postings to look at where
// documents are deleted.
const Shape kShapes[] = {
    {"Plain", {.seed = 1, .documents = 20, .compound = false, .term_index_interval = 4}},
    {"Compound", {.seed = 2, .documents = 20, .term_index_interval = 4}},
    {"PlainWithDeletions",
     {.seed = 3, .documents = 24, .deletions = 9, .compound = false, .term_index_interval = 4}},
    {"CompoundWithDeletions", {.seed = 4, .documents = 24, .deletions = 9, .term_index_interval = 4}},
    {"SeveralPlainSegments",
     {.seed = 5, .documents = 20, .documents_per_segment = 8, .deletions = 6, .compound = false}},
    {"SeveralCompoundSegments",
     {.seed = 6, .documents = 20, .documents_per_segment = 8, .deletions = 6, .delete_segment = true}},
    {"SparseDeletions",
     {.seed = 7, .documents = 700, .documents_per_segment = 1000, .deletions = 1, .compound = false}},
    {"OlderPlain", {.documents = 30, .deletions = 9}, "plain"},
    {"OlderCompound", {.documents = 30, .deletions = 9}, "compound"}};

void WriteIndex(const std::string& folder, const Shape& shape) {
  if (shape.older_layout == nullptr) return WriteRandomIndex(folder, shape.index);
  const std::string command = std::string(CLUCENE_WRITER) + " '" + folder + "' " + shape.older_layout + " " +
                              std::to_string(shape.index.documents) + " " +
                              std::to_string(shape.index.deletions);
  const int status = std::system(command.c_str());
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
}

// Everything that can be asked of an index, in one text.
std::wstring ReadEverything(const std::string& folder) {
  const auto info = vantrel::newClassInit<IndexInfo>(folder);
  std::wstring everything;
  for (int segment = 0; segment < info->GetSegmentNum(); ++segment) {
    for (const bool live_only : {false, true}) {
      const auto dictionary = info->GetTermDict(segment, live_only);
      everything += std::to_wstring(dictionary->GetTermsCount()) + L"\n";
      while (dictionary->Next()) {
        const Lucene::TermPtr term = dictionary->Term();
        everything += term->field() + L":" + term->text() + L"\n";
      }
    }
  }
  return everything + std::to_wstring(info->GetSuggestDivisor());
}

// What is read, nothing where an error is reported. The error must name a path in the folder, and damage an
// offset; any other exception passes on and fails the test.
std::optional<std::wstring> Read(const std::string& folder) {
  try {
    return ReadEverything(folder);
  } catch (const IndexDamagedError& error) {
    EXPECT_THAT(error.what(), ::testing::StartsWith(folder + "/"));
    EXPECT_THAT(error.what(), ::testing::HasSubstr(": offset " + std::to_string(error.offset()) + ": "));
  } catch (const IndexError& error) {
    EXPECT_THAT(error.what(), ::testing::StartsWith(folder));
  }
  return std::nullopt;
}

class DamagedIndexTest : public ::testing::TestWithParam<Shape> {
 protected:
  void SetUp() override {
    ASSERT_NO_FATAL_FAILURE(WriteIndex(folder_.path(), GetParam()));
    intact_ = ReadEverything(folder_.path());
  }

  const std::string& path() const { return folder_.path(); }
  const std::wstring& intact() const { return intact_; }

  // The same sequence for both of the campaigns below.
  std::mt19937 random_{20240229U + GetParam().index.seed};

 private:
  TemporaryFolder folder_;
  std::wstring intact_;
};

INSTANTIATE_TEST_SUITE_P(Shapes, DamagedIndexTest, ::testing::ValuesIn(kShapes),
                         [](const auto& test) { return test.param.name; });

TEST_P(DamagedIndexTest, EndsInItsTermsOrAnErrorThatNamesTheFile) {
  int unnoticed = 0;
  int without_effect = 0;
  for (int i = 0; i < kCasesPerShape; ++i) {
    const Damage damage = RandomDamage(path(), random_);
    SCOPED_TRACE("case " + std::to_string(i) + ": " + damage.Describe());
    const DamagedFile damaged(path(), damage);
    const std::optional<std::wstring> read = Read(path());
    if (!read.has_value()) continue;
    ++(*read == intact() ? without_effect : unnoticed);
  }
  std::cout << "of " << kCasesPerShape << " damages, " << without_effect << " did not touch the terms, and "
            << unnoticed << " changed them unnoticed\n";
  EXPECT_EQ(ReadEverything(path()), intact());
}

TEST_P(DamagedIndexTest, TheProgramEndsInOutputOrAnUncaughtException) {
  int ended_in_output = 0;
  for (int i = 0; i < kCasesPerShape; ++i) {
    const Damage damage = RandomDamage(path(), random_);
    if (i % kFewer != 0) continue;
    SCOPED_TRACE("case " + std::to_string(i) + ": " + damage.Describe());
    const DamagedFile damaged(path(), damage);
    for (const char* action : {"allterm", "term"}) {
      const LimitedRun run = RunToolLimited({"-a", action, "-i", "-d", path()});
      SCOPED_TRACE(action);
      if (WIFEXITED(run.status)) {
        ++ended_in_output;
        EXPECT_EQ(WEXITSTATUS(run.status), 0) << run.errors;
        EXPECT_THAT(run.output, ::testing::HasSubstr("total terms: "));
        EXPECT_THAT(run.output, ::testing::HasSubstr("suggest divisor:"));
        continue;
      }
      EXPECT_EQ(WTERMSIG(run.status), SIGABRT) << run.errors;
      EXPECT_THAT(run.errors, ::testing::HasSubstr("terminate called after throwing"));
      EXPECT_THAT(run.errors, ::testing::HasSubstr("what():  " + path()));
    }
  }
  EXPECT_GT(ended_in_output, 0) << "not even damages to files that are not needed leave anything to see";
}

TEST_P(DamagedIndexTest, TheProgramsCheckEndsInAVerdict) {
  constexpr int kEvery = 4;
  int found = 0;
  for (int i = 0; i < kCasesPerShape; ++i) {
    const Damage damage = RandomDamage(path(), random_);
    if (i % (kEvery * kFewer) != 0) continue;
    SCOPED_TRACE("case " + std::to_string(i) + ": " + damage.Describe());
    const DamagedFile damaged(path(), damage);
    const LimitedRun run = RunToolLimited({"-a", "check", "-d", path()});
    ASSERT_TRUE(WIFEXITED(run.status)) << "signal " << WTERMSIG(run.status) << "\n" << run.errors;
    EXPECT_EQ(WEXITSTATUS(run.status), 0);
    EXPECT_EQ(run.output, "");
    EXPECT_THAT(run.errors, ::testing::AnyOf("clean\n", "NOT clean\n"));
    if (run.errors == "NOT clean\n") ++found;
  }
  EXPECT_GT(found, 0);
  EXPECT_EQ(RunToolLimited({"-a", "check", "-d", path()}).errors, "clean\n");
}

bool IsNeeded(const std::string& file, bool has_deletions) {
  if (file.starts_with("segments_") || file.ends_with(".cfs")) return true;
  if (file.ends_with(".fnm") || file.ends_with(".tis") || file.ends_with(".tii")) return true;
  return file.ends_with(".del") || (file.ends_with(".frq") && has_deletions);
}

TEST_P(DamagedIndexTest, TheLossOfAFileIsNoticedWhereItIsNeededAndHarmlessElsewhere) {
  const std::vector<std::string> files = ListFolder(path());
  for (const std::string& file : files) {
    SCOPED_TRACE(file);
    const std::string segment = file.substr(0, file.find_first_of("_.", 1));
    const bool has_deletions = std::any_of(files.begin(), files.end(), [&](const std::string& other) {
      return other.starts_with(segment + "_") && other.ends_with(".del");
    });
    const DamagedFile damaged(path(), {.kind = Damage::Kind::kRemove, .file = file});
    if (!IsNeeded(file, has_deletions)) {
      EXPECT_EQ(ReadEverything(path()), intact());
      continue;
    }
    try {
      ReadEverything(path());
      ADD_FAILURE() << "not noticed";
    } catch (const IndexError& error) {
      EXPECT_THAT(error.what(), ::testing::StartsWith(path() + "/" + file));
    }
  }
}

}  // namespace
}  // namespace quorelastic::testing
