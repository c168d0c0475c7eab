// The action "position": where a term stands in a document.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

class TermPositionsTest : public ::testing::Test {
 protected:
  // What is said of `token` in the field "body".
  ::testing::AssertionResult Says(const std::string& expected, const std::string& token,
                                  const std::string& document = "") const {
    std::vector<std::string> options{"-f", "body", "-t", token};
    if (!document.empty()) options.insert(options.end(), {"-n", document});
    const RunResult run = Inspect("position", folder_.path(), options);
    if (run.status == 0 && run.err.empty() && run.out == expected) return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << token << " from " << document << ": " << run;
  }

  TemporaryFolder folder_;
};

TEST_F(TermPositionsTest, ShowsThePositionsInTheirOrderAndThenTheDocument) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "a b a c a"}, {.name = "title", .value = "x a"}});
  }
  EXPECT_TRUE(Says("pos: 0\npos: 2\npos: 4\ndoc: 0 freq: 3\n", "a"));
  EXPECT_TRUE(Says("pos: 1\ndoc: 0 freq: 1\n", "b", "0"));
  EXPECT_THAT(Inspect("position", folder_.path(), {"-f", "title", "-t", "a"}),
              Printed("pos: 1\ndoc: 0 freq: 1\n"));
}

TEST_F(TermPositionsTest, ShowsTheFirstDocumentFromTheOneAskedForOn) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "other"}});
    index.Add({{.name = "body", .value = "word"}});
    index.Add({{.name = "body", .value = "other"}});
    index.Add({{.name = "body", .value = "the word"}});
  }
  EXPECT_TRUE(Says("pos: 0\ndoc: 1 freq: 1\n", "word"));
  EXPECT_TRUE(Says("pos: 0\ndoc: 1 freq: 1\n", "word", "1"));
  EXPECT_TRUE(Says("pos: 1\ndoc: 3 freq: 1\n", "word", "2"));
  EXPECT_TRUE(Says("pos: 1\ndoc: 3 freq: 1\n", "word", "3"));
  EXPECT_TRUE(Says("No entry!!\n", "word", "4"));
  EXPECT_TRUE(Says("No entry!!\n", "word", "2147483647"));
  EXPECT_TRUE(Says("pos: 0\ndoc: 1 freq: 1\n", "word", "-1"));
  EXPECT_TRUE(Says("pos: 0\ndoc: 1 freq: 1\n", "word", "-2147483648"));
}

TEST_F(TermPositionsTest, CountsDocumentsThroughAllSegments) {
  {
    LibraryIndex index(folder_.path(), {.compound = false});
    for (const char* text : {"word", "other"}) index.Add({{.name = "body", .value = text}});
    index.Commit();
    for (const char* text : {"other", "a word"}) index.Add({{.name = "body", .value = text}});
    index.Commit();
    for (const char* text : {"two words word", "last"}) index.Add({{.name = "body", .value = text}});
  }
  EXPECT_TRUE(Says("pos: 0\ndoc: 0 freq: 1\n", "word", "0"));
  EXPECT_TRUE(Says("pos: 1\ndoc: 3 freq: 1\n", "word", "1"));
  EXPECT_TRUE(Says("pos: 1\ndoc: 3 freq: 1\n", "word", "2"));
  EXPECT_TRUE(Says("pos: 1\ndoc: 3 freq: 1\n", "word", "3"));
  EXPECT_TRUE(Says("pos: 2\ndoc: 4 freq: 1\n", "word", "4"));
  EXPECT_TRUE(Says("No entry!!\n", "word", "5"));
  EXPECT_TRUE(Says("pos: 0\ndoc: 5 freq: 1\n", "last"));
}

TEST_F(TermPositionsTest, PassesOverDeletedDocuments) {
  {
    LibraryIndex index(folder_.path());
    index.Add({Keyword("id", "0"), {.name = "body", .value = "word gone"}});
    index.Add({Keyword("id", "1"), {.name = "body", .value = "x word"}});
    index.Commit();
    index.Delete("id", "0");
  }
  EXPECT_TRUE(Says("pos: 1\ndoc: 1 freq: 1\n", "word"));
  EXPECT_TRUE(Says("No entry!!\n", "gone"));
}

TEST_F(TermPositionsTest, HasNoEntryForATermThatNoDocumentHolds) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "word"}});
  }
  for (const char* token : {"none", "Word", "wor", "words", " word", "\xff", "\xf0\x9f\x98\x80"}) {
    EXPECT_TRUE(Says("No entry!!\n", token));
  }
  for (const char* field : {"none", "Body", "bod", "\xff"}) {
    EXPECT_THAT(Inspect("position", folder_.path(), {"-f", field, "-t", "word"}), Printed("No entry!!\n"));
  }
}

TEST_F(TermPositionsTest, HasNoEntryInAnIndexWithoutSegments) {
  { LibraryIndex index(folder_.path()); }
  for (const char* document : {"0", "-1", "5"}) EXPECT_TRUE(Says("No entry!!\n", "word", document));
}

TEST_F(TermPositionsTest, ShowsOnePositionWhereFrequenciesAreOmitted) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "x"}});
    index.Add({{.name = "body", .value = "a a a", .frequencies = false}});
  }
  EXPECT_TRUE(Says("pos: 0\ndoc: 1 freq: 1\n", "a"));
}

TEST_F(TermPositionsTest, CountsPositionsOnThroughTheValuesOfAField) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "a b"}, {.name = "body", .value = "c a"}});
  }
  EXPECT_TRUE(Says("pos: 0\npos: 3\ndoc: 0 freq: 2\n", "a"));
}

TEST_F(TermPositionsTest, FindsADocumentAmongThousands) {
  {
    LibraryIndex index(folder_.path(), {.documents_per_segment = 10'000});
    for (int i = 0; i < 5000; ++i) {
      index.Add({{.name = "body", .value = (i % 2 == 0 ? "even " : "odd ") + std::string("all all")}});
    }
  }
  EXPECT_TRUE(Says("pos: 1\npos: 2\ndoc: 4321 freq: 2\n", "all", "4321"));
  EXPECT_TRUE(Says("pos: 0\ndoc: 4322 freq: 1\n", "even", "4321"));
  EXPECT_TRUE(Says("pos: 0\ndoc: 4999 freq: 1\n", "odd", "4998"));
  EXPECT_TRUE(Says("No entry!!\n", "even", "4999"));
}

TEST_F(TermPositionsTest, TakesTermsOfAnyScriptInAnyLocale) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "größe", .value = "中文 x 𠮷野 straße x 中文"}, Keyword("größe", "two words")});
  }
  for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no_SUCH.locale"}) {
    const auto position = [&](const char* token) {
      return Inspect("position", folder_.path(), {"-f", "größe", "-t", token}, {.environment = {locale}});
    };
    EXPECT_THAT(position("中文"), Printed("pos: 0\npos: 5\ndoc: 0 freq: 2\n"));
    EXPECT_THAT(position("𠮷野"), Printed("pos: 2\ndoc: 0 freq: 1\n"));
    EXPECT_THAT(position("straße"), Printed("pos: 3\ndoc: 0 freq: 1\n"));
    EXPECT_THAT(position("two words"), Printed("pos: 6\ndoc: 0 freq: 1\n"));
  }
}

TEST_F(TermPositionsTest, TakesAPathOfAnyScriptInAnyLocale) {
  {
    LibraryIndex index(folder_ / "index");
    index.Add({{.name = "body", .value = "word"}});
  }
  const std::string path = folder_ / "größe 中文";
  std::filesystem::rename(folder_ / "index", path);
  for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no_SUCH.locale"}) {
    EXPECT_THAT(Inspect("position", path, {"-f", "body", "-t", "word"}, {.environment = {locale}}),
                Printed("pos: 0\ndoc: 0 freq: 1\n"))
        << locale;
  }
}

TEST_F(TermPositionsTest, WithoutFieldOrTokenDoesNotTouchTheIndex) {
  for (const std::vector<std::string>& options : {std::vector<std::string>{},
                                                  {"-f", "body"},
                                                  {"-t", "word"},
                                                  {"-f", "", "-t", "word"},
                                                  {"-f", "body", "-t", ""}}) {
    EXPECT_THAT(Inspect("position", folder_ / "missing", options), Printed("Bad Parameter\n"));
    EXPECT_THAT(Inspect("position", "", options), Printed("Bad Parameter\n"));
  }
}

TEST_F(TermPositionsTest, WritesOutEveryLineAsItIsFound) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "a b a"}});
  }
  const RunResult run =
      Inspect("position", folder_.path(), {"-f", "body", "-t", "a"}, {.record_writes = true});
  EXPECT_EQ(run.writes, (std::vector<std::string>{"pos: 0\n", "pos: 2\n", "doc: 0 freq: 2\n"}));
}

}  // namespace
}  // namespace quorelastic::testing
