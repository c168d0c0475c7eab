// The offline actions on paths of any bytes, in any locale, are those on a plain path.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "support/files.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using Vector = LibraryField::Vector;

// With a second segment, a deletion, and, where `is_damaged`, one that cannot be read.
void WriteIndexAt(const std::string& path, bool is_damaged) {
  {
    LibraryIndex index(path);
    index.Add({VectorText("body", "word here word", Vector::kPositions)});
    index.Commit();
    index.Add({VectorText("body", "word there", Vector::kPositions)});
    index.Add({VectorText("body", "deleted", Vector::kPositions)});
    index.Commit();
    index.Delete("body", "deleted");
  }
  if (is_damaged) WriteFile(path + "/_1.cfs", "");
}

struct Name {
  const char* title;
  const char* bytes;
};

// What the test runner shows of it.
void PrintTo(const Name& name, std::ostream* out) { *out << name.title; }

class AnyPathTest : public ::testing::TestWithParam<Name> {
 protected:
  // An index at the plain path and the same at the other one.
  void SetUp() override {
    WriteIndexAt(plain_, false);
    WriteIndexAt(plain_damaged_, true);
    CopyFolder(plain_, path_);
    CopyFolder(plain_damaged_, path_damaged_);
  }

  static RunResult Run(const std::string& action, const std::string& path, const char* locale) {
    return Inspect(action, path, {"-f", "body", "-t", "word", "-i"},
                   {.environment = {std::string("LC_ALL=") + locale}});
  }

  // Both runs end alike, and print the same but for the path.
  static void ExpectSame(const RunResult& run, const RunResult& plain) {
    EXPECT_EQ(run.signal, plain.signal) << run;
    EXPECT_EQ(run.status, plain.status);
    EXPECT_EQ(run.out, plain.out);
    EXPECT_EQ(run.err, plain.err);
  }

  TemporaryFolder folder_;
  const std::string plain_ = folder_ / "plain";
  const std::string plain_damaged_ = folder_ / "plain damaged";
  const std::string path_ = folder_ / GetParam().bytes;
  const std::string path_damaged_ = path_ + " damaged";
};

INSTANTIATE_TEST_SUITE_P(Names, AnyPathTest,
                         ::testing::Values(Name{"Utf8",
                                                "gr\xc3\xb6\xc3\x9f"
                                                "e \xe4\xb8\xad \xf0\x9f\x98\x80"},
                                           Name{"Latin1",
                                                "gr\xf6\xdf"
                                                "e"},
                                           Name{"NoText", "\xff\xfe\x80 \xc3"},
                                           Name{"NoCharacter", "\xef\xbf\xbf and \xf0\x9f\xbf\xbf"},
                                           Name{"Surrogate", "\xed\xb2\x80"}),
                         [](const auto& test) { return test.param.title; });

constexpr const char* kLocales[] = {"C", "C.UTF-8", "no_SUCH.locale"};

TEST_P(AnyPathTest, IsReadLikeAnyOther) {
  for (const char* locale : kLocales) {
    for (const char* action : {"allterm", "term", "position", "doc_term", "term_suggest", "check"}) {
      SCOPED_TRACE(std::string(action) + " in locale " + locale);
      const RunResult plain = Run(action, plain_, "C");
      ASSERT_EQ(plain.status, 0) << plain;
      ExpectSame(Run(action, path_, locale), plain);
    }
    EXPECT_THAT(Run("check", path_damaged_, locale), Ended(0, "", "NOT clean\n"));
  }
  EXPECT_THAT(Run("position", path_, "C"), Printed("pos: 0\npos: 2\ndoc: 0 freq: 2\n"));
}

TEST_P(AnyPathTest, IsRepairedLikeAnyOther) {
  for (const char* locale : kLocales) {
    SCOPED_TRACE(locale);
    const std::string path = path_damaged_ + locale;
    CopyFolder(path_damaged_, path);
    EXPECT_THAT(Run("repair", path_, locale), Ended(0, "", "clean\n"));
    EXPECT_THAT(Run("repair", path, locale), Ended(0, "", "done\n"));
    EXPECT_THAT(Run("check", path, locale), Ended(0, "", "clean\n"));
    EXPECT_THAT(Run("position", path, locale), Printed("pos: 0\npos: 2\ndoc: 0 freq: 2\n"));
  }
}

TEST_P(AnyPathTest, MayHoldFilesOfAnyName) {
  WriteFile(path_ + "/\xff stray", "no index file");
  for (const char* locale : kLocales) {
    for (const char* action : {"allterm", "term", "position", "doc_term", "term_suggest", "check"}) {
      SCOPED_TRACE(std::string(action) + " in locale " + locale);
      ExpectSame(Run(action, path_, locale), Run(action, plain_, "C"));
    }
  }
}

}  // namespace
}  // namespace quorelastic::testing
