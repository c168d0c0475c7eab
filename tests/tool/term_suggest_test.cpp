// "term_suggest": completions of a prefix.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
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
using ::testing::StartsWith;

void WriteIndex(const std::string& path, bool compound = true) {
  LibraryIndex index(path, {.compound = compound});
  index.Add(
      {{.name = "body", .value = "tea team \xe4\xb8\xad\xe6\x96\x87"}, {.name = "other", .value = "teapot"}});
  index.Add({{.name = "body", .value = "team Tea"}});
  index.Commit();
  index.Add({{.name = "body", .value = "team \"te\\"}, Keyword("id", "gone")});
  index.Add({{.name = "body", .value = "teach"}, Keyword("id", "gone")});
  index.Commit();
  index.Delete("body", "teach");
}

constexpr char kTea[] =
    "type: prefix, {\"doc_freq\":3,\"term\":\"team\"}\n"
    "type: prefix, {\"doc_freq\":1,\"term\":\"tea\"}\n";

class TermSuggestTest : public ::testing::Test {
 protected:
  RunResult Suggest(const std::vector<std::string>& options, const RunOptions& run = {}) const {
    return Inspect("term_suggest", folder_ / "index", options, run);
  }

  TemporaryFolder folder_;
};

TEST_F(TermSuggestTest, PrintsEachSuggestionOnALineBestFirst) {
  WriteIndex(folder_ / "index");
  EXPECT_THAT(Suggest({"-f", "body", "-t", "te"}), Printed(kTea));
  EXPECT_THAT(Suggest({"--field", "body", "--token", "T"}),
              Printed("type: prefix, {\"doc_freq\":1,\"term\":\"Tea\"}\n"));
}

TEST_F(TermSuggestTest, WritesTermsAsJsonInUtf8) {
  WriteIndex(folder_ / "index");
  EXPECT_THAT(Suggest({"-f", "body", "-t", "\xe4\xb8\xad"}),
              Printed("type: prefix, {\"doc_freq\":1,\"term\":\"\xe4\xb8\xad\xe6\x96\x87\"}\n"));
  EXPECT_THAT(Suggest({"-f", "body", "-t", "\""}),
              Printed("type: prefix, {\"doc_freq\":1,\"term\":\"\\\"te\\\\\"}\n"));
}

TEST_F(TermSuggestTest, PrintsNothingWhereThereIsNothingToSuggest) {
  WriteIndex(folder_ / "index");
  EXPECT_THAT(Suggest({"-f", "body", "-t", "teach"}), Printed(""));
  EXPECT_THAT(Suggest({"-f", "nobody", "-t", "te"}), Printed(""));
  EXPECT_THAT(Suggest({"-t", "te"}), Printed("")) << "no field bears the empty name";
  EXPECT_THAT(Suggest({"-f", "body", "-t", "\xff"}), Printed(""));
}

TEST_F(TermSuggestTest, WithoutATokenEveryTermIsACompletion) {
  WriteIndex(folder_ / "index");
  EXPECT_THAT(Suggest({"-f", "body"}),
              Printed(AllOf(StartsWith("type: prefix, {\"doc_freq\":3,\"term\":\"team\"}\n"),
                            EndsWith(",\"term\":\"\xe4\xb8\xad\xe6\x96\x87\"}\n"))));
  EXPECT_EQ(LinesWithEnds(Suggest({"-f", "body"}).out).size(), 5U);
}

TEST_F(TermSuggestTest, PrintsTenAtMostWhateverTheOptionsSay) {
  {
    LibraryIndex index(folder_ / "index");
    std::string text;
    for (int i = 10; i < 40; ++i) text += std::to_string(i) + " ";
    index.Add({{.name = "body", .value = text}});
  }
  const std::string ten = Suggest({"-f", "body"}).out;
  EXPECT_EQ(LinesWithEnds(ten).size(), 10U);
  EXPECT_THAT(Suggest({"-f", "body", "-m", "2", "-si", "3", "-o", "4", "-i"}), Printed(ten));
  EXPECT_THAT(Suggest({"-f", "body", "-m", "-1", "-si", "-1", "-o", "-1"}), Printed(ten));
}

TEST_F(TermSuggestTest, WorksInAnyLocale) {
  WriteIndex(folder_ / "index");
  for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=nowhere"}) {
    EXPECT_THAT(Suggest({"-f", "body", "-t", "te"}, {.environment = {locale}}), Printed(kTea)) << locale;
  }
}

TEST_F(TermSuggestTest, TakesAPathThatIsNoText) {
  WriteIndex(folder_ / "index");
  std::filesystem::rename(folder_ / "index", folder_ / "\xff\xfe");
  EXPECT_THAT(Inspect("term_suggest", folder_ / "\xff\xfe", {"-f", "body", "-t", "te"}), Printed(kTea));
}

TEST_F(TermSuggestTest, TakesARelativePathWithASlash) {
  WriteIndex(folder_ / "index");
  EXPECT_THAT(
      RunTool({"-a", "term_suggest", "-d", "./index", "-f", "body", "-t", "te"}, {.folder = folder_.path()}),
      Printed(kTea));
}

TEST_F(TermSuggestTest, LeavesTheIndexAsItWas) {
  WriteIndex(folder_ / "index");
  std::map<std::string, std::string> before;
  for (const std::string& name : ListFolder(folder_ / "index"))
    before[name] = ReadFile(folder_ / "index/" + name);
  EXPECT_THAT(Suggest({"-f", "body", "-t", "te"}), Printed(kTea));
  std::map<std::string, std::string> after;
  for (const std::string& name : ListFolder(folder_ / "index"))
    after[name] = ReadFile(folder_ / "index/" + name);
  EXPECT_EQ(after, before);
}

TEST_F(TermSuggestTest, ReportsAMissingFolderAndEndsNormally) {
  EXPECT_THAT(
      Suggest({"-f", "body", "-t", "te"}),
      Printed("Exception:" + folder_ / "index: cannot open index folder: No such file or directory\n"));
  EXPECT_FALSE(std::filesystem::exists(folder_ / "index"));
}

TEST_F(TermSuggestTest, ReportsAFolderWithoutIndex) {
  std::filesystem::create_directory(folder_ / "index");
  EXPECT_THAT(
      Suggest({"-f", "body", "-t", "te"}),
      Printed("Exception:" + folder_ / "index: no index in this folder: it holds no segments file\n"));
}

TEST_F(TermSuggestTest, ReportsDamageWithTheFileAndPrintsNoSuggestion) {
  WriteIndex(folder_ / "index", false);
  for (const char* name : {"_0.tis", "_0.tii", "_1.fnm", "_1_1.del"}) {
    const std::string file = folder_ / "index/" + name;
    ASSERT_TRUE(std::filesystem::exists(file)) << file;
    const std::string bytes = ReadFile(file);
    WriteFile(file, bytes.substr(0, bytes.size() / 2));
    const RunResult run = Suggest({"-f", "body", "-t", "te"});
    EXPECT_THAT(run, Printed(ContainsRegex("^Exception:" + file + ": offset [0-9]+: [^\n]*\n$")));
    WriteFile(file, bytes);
  }
  EXPECT_THAT(Suggest({"-f", "body", "-t", "te"}), Printed(kTea));
}

// Where a name without a slash leads.
class NamedIndexTest : public SandboxTest {
 protected:
  RunResult Suggest(const std::string& name) const {
    return sandbox_.RunTool({"-a", "term_suggest", "-d", name, "-f", "body", "-t", "te"});
  }

  Sandbox sandbox_;
};

TEST_F(NamedIndexTest, StandsUnderTheDaemonsFolder) {
  WriteIndex(sandbox_.data_root() + "/mail");
  EXPECT_THAT(Suggest("mail"), Printed(kTea));
}

TEST_F(NamedIndexTest, IsReportedWithItsPathWhereThereIsNone) {
  EXPECT_THAT(
      Suggest("news"),
      Printed("Exception:/var/lib/quorelastic/news: cannot open index folder: No such file or directory\n"));
  EXPECT_THAT(
      Suggest(""),
      Printed("Exception:/var/lib/quorelastic/: no index in this folder: it holds no segments file\n"));
}

TEST_F(NamedIndexTest, AnIndexThatMayNotBeReadIsReported) {
  const std::string path = sandbox_.data_root() + "/mail";
  WriteIndex(path, false);
  std::filesystem::permissions(path + "/_0.tis", std::filesystem::perms::none);
  EXPECT_THAT(Suggest("mail"),
              Printed("Exception:/var/lib/quorelastic/mail/_0.tis: cannot open file: Permission denied\n"));
}

}  // namespace
}  // namespace quorelastic::testing
