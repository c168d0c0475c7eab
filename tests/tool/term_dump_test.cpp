// The actions "allterm" and "term": the term dictionary of every segment.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "support/byte_writer.h"
#include "support/files.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::StartsWith;

constexpr char kBothActions[][8] = {"allterm", "term"};

class TermDumpTest : public ::testing::Test {
 protected:
  TemporaryFolder folder_;
};

// Compound and plain files, and term indexes from every term to none but the first.
struct Layout {
  std::string name;
  LibraryIndex::Options options;
};

void PrintTo(const Layout& layout, std::ostream* stream) { *stream << layout.name; }

class StorageTest : public TermDumpTest, public ::testing::WithParamInterface<Layout> {};

TEST_P(StorageTest, ShowsTheSameTerms) {
  {
    LibraryIndex index(folder_.path(), GetParam().options);
    index.Add({{.name = "title", .value = "Zebra apple"}, {.name = "body", .value = "pear apple apple"}});
    index.Add({Keyword("id", "two words"), {.name = "body", .value = "apple plum"}});
    index.Commit();
    index.Add({Keyword("id", "3"), {.name = "body", .value = "gone apple", .frequencies = false}});
    index.Add({Keyword("id", "4"), {.name = "body", .value = "apple fig", .frequencies = false}});
    index.Commit();
    index.Delete("id", "3");
  }
  EXPECT_THAT(Inspect("allterm", folder_.path(), {"--info"}), Printed("segment: _0, terms count: 6\n"
                                                                      "field: body text: apple\n"
                                                                      "field: body text: pear\n"
                                                                      "field: body text: plum\n"
                                                                      "field: id text: two words\n"
                                                                      "field: title text: Zebra\n"
                                                                      "field: title text: apple\n"
                                                                      "segment: _1, terms count: 5\n"
                                                                      "field: body text: apple\n"
                                                                      "field: body text: fig\n"
                                                                      "field: body text: gone\n"
                                                                      "field: id text: 3\n"
                                                                      "field: id text: 4\n"
                                                                      "total terms: 11\n"
                                                                      "suggest divisor:1\n"));
  EXPECT_THAT(Inspect("term", folder_.path(), {"--info"}), Printed("segment: _0, terms count: 6\n"
                                                                   "field: body text: apple\n"
                                                                   "field: body text: pear\n"
                                                                   "field: body text: plum\n"
                                                                   "field: id text: two words\n"
                                                                   "field: title text: Zebra\n"
                                                                   "field: title text: apple\n"
                                                                   "segment: _1, terms count: 3\n"
                                                                   "field: body text: apple\n"
                                                                   "field: body text: fig\n"
                                                                   "field: id text: 4\n"
                                                                   "total terms: 9\n"
                                                                   "suggest divisor:1\n"));
}

INSTANTIATE_TEST_SUITE_P(
    EveryLayout, StorageTest,
    ::testing::Values(Layout{"Compound", {.compound = true}}, Layout{"Plain", {.compound = false}},
                      Layout{"CompoundAllTermsIndexed", {.compound = true, .term_index_interval = 1}},
                      Layout{"PlainHalfTheTermsIndexed", {.compound = false, .term_index_interval = 2}}),
    [](const auto& instance) { return instance.param.name; });

TEST_F(TermDumpTest, WithoutInfoShowsTheSegmentsAloneWhateverElseIsAskedFor) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "one two three"}});
    index.Commit();
    index.Add({{.name = "body", .value = "four"}});
  }
  const char* const expected =
      "segment: _0, terms count: 3\n"
      "segment: _1, terms count: 1\n"
      "total terms: 4\n"
      "suggest divisor:1\n";
  for (const char* action : kBothActions) {
    EXPECT_THAT(Inspect(action, folder_.path()), Printed(expected));
    EXPECT_THAT(Inspect(action, folder_.path(), {"-f", "none", "-m", "0"}), Printed(expected));
    EXPECT_THAT(Inspect(action, folder_.path(), {"-f", "body", "-m", "1", "-t", "one", "-n", "7"}),
                Printed(expected));
  }
}

TEST_F(TermDumpTest, OfAnIndexWithoutSegmentsShowsTheTotalsAlone) {
  { LibraryIndex index(folder_.path()); }
  for (const char* action : kBothActions) {
    EXPECT_THAT(Inspect(action, folder_.path(), {"-i"}), Printed("total terms: 0\nsuggest divisor:1\n"));
  }
}

TEST_F(TermDumpTest, ShowsASegmentWithoutTerms) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "   "}});
  }
  for (const char* action : kBothActions) {
    EXPECT_THAT(Inspect(action, folder_.path(), {"-i"}),
                Printed("segment: _0, terms count: 0\ntotal terms: 0\nsuggest divisor:1\n"));
  }
}

TEST_F(TermDumpTest, ShowsASegmentWhoseDocumentsAreAllDeleted) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "all gone"}});
    index.Add({{.name = "body", .value = "all lost"}});
    index.Commit();
    index.Delete("body", "all");
  }
  EXPECT_THAT(Inspect("allterm", folder_.path(), {"-i"}), Printed("segment: _0, terms count: 3\n"
                                                                  "field: body text: all\n"
                                                                  "field: body text: gone\n"
                                                                  "field: body text: lost\n"
                                                                  "total terms: 3\n"
                                                                  "suggest divisor:1\n"));
  EXPECT_THAT(Inspect("term", folder_.path(), {"-i"}),
              Printed("segment: _0, terms count: 0\ntotal terms: 0\nsuggest divisor:1\n"));
}

TEST_F(TermDumpTest, ForgetsDeletedTermsOnceTheirSegmentsAreMerged) {
  {
    LibraryIndex index(folder_.path());
    index.Add({Keyword("id", "a"), {.name = "body", .value = "first both"}});
    index.Commit();
    index.Add({Keyword("id", "b"), {.name = "body", .value = "second both"}});
    index.Commit();
    index.Delete("id", "a");
    index.Optimize();
  }
  for (const char* action : kBothActions) {
    EXPECT_THAT(Inspect(action, folder_.path(), {"-i"}), Printed("segment: _2, terms count: 3\n"
                                                                 "field: body text: both\n"
                                                                 "field: body text: second\n"
                                                                 "field: id text: b\n"
                                                                 "total terms: 3\n"
                                                                 "suggest divisor:1\n"));
  }
}

class TwoSegmentDumpTest : public TermDumpTest {
 protected:
  TwoSegmentDumpTest() {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "b1 b2 b3"}, {.name = "bodyguard", .value = "g1 g2"}});
    index.Commit();
    index.Add(
        {{.name = "Body", .value = "B1"}, {.name = "body", .value = "b4"}, {.name = "bo", .value = "o1"}});
  }

  // The lines between the segments' lines and the totals', "/" for a segment's line.
  std::string Listed(const std::string& action, const std::vector<std::string>& options) const {
    std::vector<std::string> all{"-i"};
    all.insert(all.end(), options.begin(), options.end());
    const RunResult run = Inspect(action, folder_.path(), all);
    EXPECT_THAT(run, Printed(EndsWith("total terms: 8\nsuggest divisor:1\n")));
    std::string listed;
    for (const std::string& line : LinesWithEnds(run.out)) {
      if (line == "segment: _0, terms count: 5\n" || line == "segment: _1, terms count: 3\n") listed += "/";
      if (line.starts_with("field: ")) listed += line.substr(7, line.size() - 8) + ";";
    }
    return listed;
  }
};

TEST_F(TwoSegmentDumpTest, ListsAtMostTheMaximumOfEverySegment) {
  for (const char* action : kBothActions) {
    EXPECT_EQ(Listed(action, {"-m", "2"}), "/body text: b1;body text: b2;/Body text: B1;bo text: o1;");
    EXPECT_EQ(Listed(action, {"-m", "1"}), "/body text: b1;/Body text: B1;");
    EXPECT_EQ(Listed(action, {"-m", "0"}), "//");
    EXPECT_EQ(Listed(action, {"-m", "-1"}), "//");
    EXPECT_EQ(Listed(action, {}),
              "/body text: b1;body text: b2;body text: b3;bodyguard text: g1;bodyguard text: g2;"
              "/Body text: B1;bo text: o1;body text: b4;");
  }
}

TEST_F(TwoSegmentDumpTest, ListsTheTermsOfExactlyTheFieldAskedFor) {
  for (const char* action : kBothActions) {
    EXPECT_EQ(Listed(action, {"-f", "body"}), "/body text: b1;body text: b2;body text: b3;/body text: b4;");
    EXPECT_EQ(Listed(action, {"-f", "Body"}), "//Body text: B1;");
    EXPECT_EQ(Listed(action, {"-f", "bo"}), "//bo text: o1;");
    for (const char* none : {"b", "BODY", "body ", " body", "bodyguards", "body*", "none", "\xff", "bödy"}) {
      EXPECT_EQ(Listed(action, {"-f", none}), "//") << none;
    }
    EXPECT_EQ(Listed(action, {"-f", "none", "-f", "", "-m", "1"}), "/body text: b1;/Body text: B1;");
  }
}

TEST_F(TwoSegmentDumpTest, CountsTheTermsOfTheFieldAloneTowardsTheMaximum) {
  for (const char* action : kBothActions) {
    EXPECT_EQ(Listed(action, {"-f", "bodyguard", "-m", "1"}), "/bodyguard text: g1;/");
    EXPECT_EQ(Listed(action, {"-f", "body", "-m", "1"}), "/body text: b1;/body text: b4;");
  }
}

TEST_F(TermDumpTest, ListsAThousandTermsOfEverySegmentByDefault) {
  {
    LibraryIndex index(folder_.path());
    for (int segment = 0; segment < 2; ++segment) {
      std::string text;
      for (int i = 0; i < 1001; ++i) text += " t" + std::to_string(10000 + i);
      index.Add({{.name = "body", .value = text}});
      index.Commit();
    }
  }
  for (const char* action : kBothActions) {
    const std::string out = Inspect(action, folder_.path(), {"-i"}).out;
    EXPECT_EQ(CountLines(out, "field: body text: t"), 2000U);
    EXPECT_EQ(CountLines(out, "field: body text: t10999\n"), 2U);
    EXPECT_THAT(out, Not(HasSubstr("t11000")));
    EXPECT_THAT(out, EndsWith("total terms: 2002\nsuggest divisor:1\n"));
    EXPECT_EQ(CountLines(Inspect(action, folder_.path(), {"-i", "-m", "1001"}).out, "field: "), 2002U);
  }
}

TEST_F(TermDumpTest, ShowsAnyScriptInTheOrderOfCodePoints) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "größe", .value = "straße ελληνικά 中文 Ωμ 𠮷野 😀 \uE000 é"},
               {.name = "中", .value = "日本"}});
  }
  const char* const expected =
      "segment: _0, terms count: 9\n"
      "field: größe text: straße\n"
      "field: größe text: é\n"
      "field: größe text: Ωμ\n"
      "field: größe text: ελληνικά\n"
      "field: größe text: 中文\n"
      "field: größe text: \uE000\n"
      "field: größe text: 😀\n"
      "field: größe text: 𠮷野\n"
      "field: 中 text: 日本\n"
      "total terms: 9\n"
      "suggest divisor:1\n";
  for (const char* action : kBothActions) {
    for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no_SUCH.locale"}) {
      EXPECT_THAT(Inspect(action, folder_.path(), {"-i"}, {.environment = {locale}}), Printed(expected));
    }
    const RunResult one_field = Inspect(action, folder_.path(), {"-i", "-f", "größe", "-m", "3"});
    EXPECT_EQ(CountLines(one_field.out, "field: größe text: "), 3U);
    EXPECT_EQ(CountLines(one_field.out, "field: "), 3U);
  }
}

TEST_F(TermDumpTest, ShowsTermsAsTheyAreBlanksLineEndsAndAll) {
  {
    LibraryIndex index(folder_.path());
    index.Add({Keyword("k", ""), Keyword("", "nameless"), Keyword("k", "a\nb"), Keyword("k", "\t")});
  }
  EXPECT_THAT(Inspect("allterm", folder_.path(), {"-i"}), Printed("segment: _0, terms count: 4\n"
                                                                  "field:  text: nameless\n"
                                                                  "field: k text: \n"
                                                                  "field: k text: \t\n"
                                                                  "field: k text: a\nb\n"
                                                                  "total terms: 4\n"
                                                                  "suggest divisor:1\n"));
}

TEST_F(TermDumpTest, ShowsATermOfThousandsOfBytes) {
  const std::string longest = "é" + std::string(16'000, 'x');
  {
    LibraryIndex index(folder_.path());
    index.Add({Keyword("k", longest)});
  }
  EXPECT_THAT(Inspect("allterm", folder_.path(), {"-i"}),
              Printed(HasSubstr("\nfield: k text: " + longest + "\n")));
}

TEST_F(TermDumpTest, WritesOutEveryLineAsItIsFound) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "one two"}});
    index.Commit();
    index.Add({{.name = "body", .value = "three"}});
  }
  const RunResult run = Inspect("allterm", folder_.path(), {"-i"}, {.record_writes = true});
  EXPECT_THAT(run, Printed(StartsWith("segment: _0")));
  EXPECT_EQ(run.writes, LinesWithEnds(run.out));
  EXPECT_EQ(run.writes.size(), 7U);
}

class PathTest : public TermDumpTest {
 protected:
  PathTest() {
    LibraryIndex index(folder_ / "index");
    index.Add({{.name = "body", .value = "here"}});
  }

  static constexpr char kExpected[] =
      "segment: _0, terms count: 1\n"
      "field: body text: here\n"
      "total terms: 1\n"
      "suggest divisor:1\n";
};

TEST_F(PathTest, MayHoldAnyBytesInAnyLocale) {
  for (const char* name : {"größe 中文", "bytes \xff\xfe", "new\nline", "\xed\xa0\x80", "-d", "a*b?"}) {
    const std::string path = folder_ / name;
    std::filesystem::rename(folder_ / "index", path);
    for (const char* action : kBothActions) {
      for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no_SUCH.locale"}) {
        EXPECT_THAT(Inspect(action, path, {"-i"}, {.environment = {locale}}), Printed(kExpected)) << name;
      }
    }
    std::filesystem::rename(path, folder_ / "index");
  }
}

TEST_F(PathTest, MayBeRelativeALinkOrEndInASlash) {
  std::filesystem::create_directory_symlink("index", folder_ / "link");
  for (const char* action : kBothActions) {
    EXPECT_THAT(Inspect(action, folder_ / "index/", {"-i"}), Printed(kExpected));
    EXPECT_THAT(Inspect(action, folder_ / "link", {"-i"}), Printed(kExpected));
    EXPECT_THAT(Inspect(action, ".", {"-i"}, {.folder = folder_ / "index"}), Printed(kExpected));
    EXPECT_THAT(Inspect(action, "index", {"-i"}, {.folder = folder_.path()}), Printed(kExpected));
  }
}

// One plain segment whose second term is damaged: it shares more with the first than that one has.
void WriteIndexWithADamagedSecondTerm(const TemporaryFolder& folder) {
  WriteFile(
      folder / "segments_1",
      ByteWriter().Int(-2).Long(1).Int(1).Int(1).String("_0").Int(1).Long(-1).Int(-1).Byte(0xff).bytes());
  WriteFile(folder / "_0.fnm", ByteWriter().VInt(-2).VInt(1).String("f").Byte(1).bytes());
  ByteWriter terms = ByteWriter().Int(-4).Long(2).Int(128).Int(16).Int(10);
  WriteFile(folder / "_0.tii", ByteWriter().Int(-4).Long(0).Int(128).Int(16).Int(10).bytes());
  terms.VInt(0).String("first").VInt(0).VInt(1).VInt(0).VInt(0);
  terms.VInt(9).String("second").VInt(0).VInt(1).VInt(1).VInt(0);
  WriteFile(folder / "_0.tis", terms.bytes());
}

TEST_F(TermDumpTest, AtTheCapTheCursorHasMovedOnceMoreThanWasPrinted) {
  WriteIndexWithADamagedSecondTerm(folder_);
  const std::string head = "segment: _0, terms count: 2\n";
  EXPECT_THAT(Inspect("allterm", folder_.path()), Printed(head + "total terms: 2\nsuggest divisor:1\n"));
  const std::string damaged = "vantrel::elastic::IndexDamagedError";
  EXPECT_THAT(Inspect("allterm", folder_.path(), {"-info", "-m", "1"}),
              Aborted(head + "field: f text: first\n", damaged, ::testing::HasSubstr("_0.tis: offset")));
}

}  // namespace
}  // namespace quorelastic::testing
