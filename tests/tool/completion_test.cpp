// The completion for bash offers what the tool takes. Bash itself runs it.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <set>
#include <string>
#include <vector>

#include "support/files.h"
#include "support/repository.h"
#include "support/sandbox_test.h"
#include "support/temporary_folder.h"
#include "support/text_search.h"
#include "support/tool_run.h"
#include "tool/option_table.h"
#include "vantrel/elastic/search_plugin.h"

namespace quorelastic::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::UnorderedElementsAre;
using ::testing::UnorderedElementsAreArray;

namespace fs = std::filesystem;
using Strings = std::vector<std::string>;

// What bash is to run: the completion of the words in its arguments, the last one being completed. With a file as
// the first argument, that is sourced before, as the helpers of the package bash-completion are.
constexpr char kScript[] =
    "[[ -z $1 ]] || source \"$1\"\n"
    "source \"$2\"\n"
    "COMP_WORDS=(quorelastic \"${@:3}\"); COMP_CWORD=$(($# - 2)); COMPREPLY=()\n"
    "_quorelastic\n"
    "[[ ${#COMPREPLY[@]} -eq 0 ]] || printf '%s\\n' \"${COMPREPLY[@]}\"\n";

Strings Command(const Strings& words, const std::string& helpers = "") {
  Strings command{
      "bash", "--norc", "-c", kScript, "bash", helpers, RepositoryPath("packaging/completion/quorelastic")};
  command.insert(command.end(), words.begin(), words.end());
  return command;
}

Strings Offered(const RunResult& run) {
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_EQ(run.err, "");
  return SplitLines(run.out);
}

Strings Complete(const Strings& words, const std::string& helpers = "") {
  return Offered(RunCommand(Command(words, helpers)));
}

Strings WithDashes(const std::string& dashes, Strings names) {
  for (std::string& name : names) name = dashes + name;
  return names;
}

TEST(CompletionTest, IsForTheTool) {
  const RunResult run = RunCommand({"bash", "--norc", "-c", "source \"$1\"; complete -p quorelastic", "bash",
                                    RepositoryPath("packaging/completion/quorelastic")});
  EXPECT_EQ(run.out, "complete -F _quorelastic quorelastic\n") << run;
}

TEST(CompletionTest, OffersEveryOptionOfTheTool) {
  const Strings all = WithDashes("--", ReadOptionTable());
  EXPECT_EQ(Complete({""}), all);
  EXPECT_EQ(Complete({"-"}), all);
  EXPECT_EQ(Complete({"--"}), all);
  EXPECT_EQ(Complete({"--action", "check", ""}), all);
}

TEST(CompletionTest, GoesOnWithOneDashOrTwo) {
  for (const std::string& option : ReadOptionTable()) {
    for (const char* dashes : {"-", "--"}) {
      const Strings offered = Complete({dashes + option.substr(0, 1)});
      EXPECT_THAT(offered, ::testing::Contains(dashes + option));
      for (const std::string& one : offered)
        EXPECT_TRUE(one.starts_with(dashes + option.substr(0, 1))) << one;
    }
  }
  EXPECT_THAT(Complete({"-s"}), ElementsAre("-string", "-size"));
}

TEST(CompletionTest, KnowsWhichOptionsTakeAValue) {
  const Strings all = WithDashes("--", ReadOptionTable());
  for (const std::string& option : ReadOptionTable()) {
    const bool takes_value = Complete({"--" + option, "--inf"}) != Strings{"--info"};
    EXPECT_EQ(takes_value, TakesValue(option)) << option;
    EXPECT_EQ(Complete({"--" + option, "--action", ""}) == all, TakesValue(option)) << option;
  }
}

TEST(CompletionTest, OffersEveryActionOfTheTool) {
  const std::set<std::string> actions = ReadActions();
  EXPECT_THAT(Complete({"--action", ""}), UnorderedElementsAreArray(actions));
  EXPECT_THAT(Complete({"-a", "c"}), UnorderedElementsAre("command", "check"));
}

TEST(CompletionTest, OffersThePluginsThatAreAlwaysThere) {
  Strings names;
  for (const auto& plugin : vantrel::elastic::SearchPluginRegistry::BuiltIn().List()) {
    names.push_back(plugin->name());
  }
  EXPECT_THAT(Complete({"--Plugin", ""}), UnorderedElementsAreArray(names));
  EXPECT_THAT(Complete({"-P", "r"}), ElementsAre("range"));
}

TEST(CompletionTest, TakesValuesBehindAnEqualsSign) {
  EXPECT_THAT(Complete({"--action", "=", "voc"}), IsEmpty());
  EXPECT_THAT(Complete({"--action", "=", "vm"}), ElementsAre("vmtouch"));
  EXPECT_THAT(Complete({"-Pl", "="}), ElementsAre("term", "ids", "range", "category"));
  // Where bash does not take the words apart.
  EXPECT_THAT(Complete({"--action=vm"}), ElementsAre("--action=vmtouch"));
  EXPECT_THAT(Complete({"-a=vm"}), ElementsAre("-a=vmtouch"));
  EXPECT_THAT(Complete({"--nothing=vm"}), IsEmpty());
}

TEST(CompletionTest, OffersNothingWhereNothingIsKnown) {
  EXPECT_THAT(Complete({"word"}), IsEmpty());
  EXPECT_THAT(Complete({"--", ""}), IsEmpty());
  EXPECT_THAT(Complete({"--query", ""}), IsEmpty());
  EXPECT_THAT(Complete({"--no"}), IsEmpty());
  EXPECT_THAT(Complete({"--string", ""}), ElementsAre("-"));
}

TEST(CompletionTest, OffersFilesForAPathAndFoldersForAnIndex) {
  const TemporaryFolder folder;
  WriteFile(folder / "request.json", "{}");
  fs::create_directory(folder / "an index");
  const std::string begin = folder.path() + "/";
  EXPECT_THAT(Complete({"--path", begin}), UnorderedElementsAre(begin + "request.json", begin + "an index"));
  EXPECT_THAT(Complete({"--path", begin + "r"}), ElementsAre(begin + "request.json"));
  EXPECT_THAT(Complete({"--db", begin}), ElementsAre(begin + "an index"));
  EXPECT_THAT(Complete({"--db=" + begin}), ElementsAre("--db=" + begin + "an index"));
}

TEST(CompletionTest, LeavesFilesToTheHelperWhereThatIsThere) {
  const TemporaryFolder folder;
  WriteFile(folder / "helpers", "_filedir() { COMPREPLY=(\"helper $* of $cur\"); }\n");
  EXPECT_THAT(Complete({"--path", "x"}, folder / "helpers"), ElementsAre("helper  of x"));
  EXPECT_THAT(Complete({"--db", "x"}, folder / "helpers"), ElementsAre("helper -d of x"));
}

class IndexCompletionTest : public SandboxTest {
 protected:
  Strings Complete(const Strings& words) const { return Offered(sandbox_.RunCommand(Command(words))); }

  Sandbox sandbox_;
};

TEST_F(IndexCompletionTest, OffersTheIndexesOfTheDaemon) {
  for (const char* name : {"books", "mail-2", "import", ".new-films", "No_Name"}) {
    fs::create_directory(sandbox_.data_root() + "/" + name);
  }
  WriteFile(sandbox_.data_root() + "/bookmarks", "");
  EXPECT_THAT(Complete({"--Index", ""}), UnorderedElementsAre("books", "mail-2"));
  EXPECT_THAT(Complete({"-I", "boo"}), ElementsAre("books"));
  EXPECT_THAT(Complete({"--action", "term_suggest", "--db", "m"}), ElementsAre("mail-2"));
  EXPECT_THAT(Complete({"--action=term_suggest", "--db", "m"}), ElementsAre("mail-2"));
  EXPECT_THAT(Complete({"--action", "term", "--db", "m"}), IsEmpty());
  EXPECT_THAT(Complete({"--db", "/var/lib/quorelastic/boo"}), ElementsAre("/var/lib/quorelastic/books"));
}

TEST_F(IndexCompletionTest, OffersNoneWhereTheFolderCannotBeRead) {
  fs::create_directory(sandbox_.data_root() + "/books");
  EXPECT_THAT(Complete({"--Index", ""}), ElementsAre("books"));
  fs::permissions(sandbox_.data_root(), fs::perms::none);
  EXPECT_THAT(Complete({"--Index", ""}), IsEmpty());
  fs::permissions(sandbox_.data_root(), fs::perms::owner_all);
}

}  // namespace
}  // namespace quorelastic::testing
