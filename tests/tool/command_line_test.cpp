// Options, their conversion, the choice of the action, the exit status.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/inotify.h>

#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <vector>

#include "support/sandbox_test.h"
#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::SizeIs;
using ::testing::StartsWith;

constexpr int kUnknown = '?';  // what the parser returns for what it does not understand
constexpr int kHelp = 'h';

constexpr std::array<std::string_view, 16> kOptionNames = {
    "action", "string", "path",  "db",   "max",    "field",  "token", "ndoc",
    "Index",  "info",   "query", "size", "offset", "Plugin", "Data",  "help"};

bool TakesArgument(std::string_view option) { return option != "info" && option != "help"; }

std::vector<std::string_view> OptionsThatBeginWith(std::string_view prefix) {
  std::vector<std::string_view> found;
  std::ranges::copy_if(kOptionNames, std::back_inserter(found),
                       [&](std::string_view name) { return name.starts_with(prefix); });
  return found;
}

TEST(CommandLineTest, WithoutArgumentsShowsTheUsage) { EXPECT_THAT(RunTool({}), ShowedUsage()); }

TEST(CommandLineTest, KnowsAnActionByItsExactWordAlone) {
  for (const char* word : {"", "Search", "SEARCH", " search", "search ", "searchx", "searc", "all_term",
                           "doc-term", "command\n", "help", "--help", "-a", "vmtouch,check"}) {
    EXPECT_THAT(RunTool({"-a", word}), ShowedUsage()) << "action \"" << word << '"';
  }
}

TEST(CommandLineTest, WithoutAnActionShowsTheUsageWhateverElseIsGiven) {
  EXPECT_THAT(RunTool({"-d", "/tmp", "-f", "field", "-t", "token", "-i"}), ShowedUsage());
  EXPECT_THAT(RunTool({"plugin"}), ShowedUsage());
  EXPECT_THAT(RunTool({"-", "--", "-a", "plugin"}), ShowedUsage());
}

TEST(CommandLineTest, TakesHelpForAnUnknownArgument) {
  for (const char* help : {"--help", "-help", "-h", "--h", "--hel"}) {
    EXPECT_THAT(RunTool({help}), Rejected(kHelp, IsEmpty())) << help;
    EXPECT_THAT(RunTool({"-a", "plugin", help}), Rejected(kHelp, IsEmpty())) << help;
  }
}

TEST(CommandLineTest, TakesEveryUnambiguousBeginningOfAnOptionAfterOneDashOrTwo) {
  for (const std::string_view name : kOptionNames) {
    for (size_t length = 1; length <= name.size(); ++length) {
      for (const char* dashes : {"-", "--"}) {
        const std::string_view beginning = name.substr(0, length);
        const std::string option = dashes + std::string(beginning);
        std::vector<std::string> arguments{"-a", "plugin", option};
        if (name == "action") arguments = {option, "plugin"};
        if (TakesArgument(name) && name != "action") arguments.push_back("0");
        const RunResult run = RunTool(arguments);
        if (OptionsThatBeginWith(beginning).size() > 1) {
          EXPECT_THAT(run, Rejected(kUnknown, AllOf(HasSubstr(option), HasSubstr("ambiguous")))) << option;
        } else if (name == "help") {
          EXPECT_THAT(run, Rejected(kHelp, IsEmpty())) << option;
        } else {
          EXPECT_THAT(run, Printed("")) << option;
        }
      }
    }
  }
}

TEST(CommandLineTest, TakesAnArgumentAfterAnEqualsSign) {
  for (const char* action : {"-a=plugin", "--a=plugin", "-action=plugin", "--action=plugin"}) {
    EXPECT_THAT(RunTool({action}), Printed("")) << action;
  }
  for (const std::string_view name : kOptionNames) {
    if (!TakesArgument(name) || name == "action") continue;
    const std::string option = "--" + std::string(name) + "=value";
    EXPECT_THAT(RunTool({option, "-a=plugin"}), Printed("")) << option;
  }
  EXPECT_THAT(RunTool({"--action="}), ShowedUsage());
}

TEST(CommandLineTest, NamesBothOptionsThatAnAmbiguousBeginningMatches) {
  EXPECT_THAT(RunTool({"-s", "{}"}),
              Rejected(kUnknown, AllOf(HasSubstr("'-s'"), HasSubstr("string'"), HasSubstr("size'"))));
  EXPECT_THAT(RunTool({"--s=20"}),
              Rejected(kUnknown, AllOf(HasSubstr("--s"), HasSubstr("--string"), HasSubstr("--size"))));
  EXPECT_THAT(RunTool({"-a", "plugin", "-st", "{}"}), Printed(""));
  EXPECT_THAT(RunTool({"-a", "plugin", "-si", "20"}), Printed(""));
}

TEST(CommandLineTest, RejectsWhatIsNoOption) {
  for (const char* option : {"-S", "-x", "--db_path", "--index", "--doc_id", "--fields", "-aplugin", "-di",
                             "--Action", "--INFO", "-A", "--plugin_", "-i1"}) {
    const std::string name = std::string(option).substr(std::string(option).find_first_not_of('-'));
    EXPECT_THAT(RunTool({option, "/x"}), Rejected(kUnknown, HasSubstr(name))) << option;
    EXPECT_THAT(RunTool({"-a", "plugin", option, "20"}), Rejected(kUnknown, HasSubstr(name))) << option;
  }
}

TEST(CommandLineTest, RejectsAnOptionWithoutItsArgument) {
  for (const std::string_view name : kOptionNames) {
    if (!TakesArgument(name)) continue;
    const std::string option = "--" + std::string(name);
    EXPECT_THAT(RunTool({"-a", "plugin", option}), Rejected(kUnknown, HasSubstr(option))) << option;
  }
  EXPECT_THAT(RunTool({"-a"}), Rejected(kUnknown, HasSubstr("action")));
}

TEST(CommandLineTest, RejectsAnArgumentForAnOptionThatTakesNone) {
  EXPECT_THAT(RunTool({"-a", "plugin", "--info=1"}), Rejected(kUnknown, HasSubstr("--info")));
  EXPECT_THAT(RunTool({"-a", "plugin", "--info="}), Rejected(kUnknown, HasSubstr("--info")));
  EXPECT_THAT(RunTool({"--help=all"}), Rejected(kUnknown, HasSubstr("--help")));
}

TEST(CommandLineTest, StopsAtTheFirstOptionItDoesNotUnderstand) {
  const RunResult run = RunTool({"-a", "search", "-x", "-I", "idx", "--later-one", "--help"});
  EXPECT_THAT(run, Rejected(kUnknown, AllOf(HasSubstr("-x"), Not(HasSubstr("later-one")))));
}

TEST(CommandLineTest, TakesTheNextWordForTheArgumentWhateverItLooksLike) {
  EXPECT_THAT(RunTool({"-a", "plugin", "-d", "--help"}), Printed(""));
  EXPECT_THAT(RunTool({"-a", "plugin", "-f", "--"}), Printed(""));
  EXPECT_THAT(RunTool({"-d", "-a", "plugin"}), ShowedUsage());
}

TEST(CommandLineTest, PassesOverWordsThatBelongToNoOption) {
  EXPECT_THAT(RunTool({"search", "-a", "plugin", "check", "", "-"}), Printed(""));
  EXPECT_THAT(RunTool({"-a", "plugin", "--", "-x", "--help", "-a", "dump"}), Printed(""));
}

TEST(CommandLineTest, LetsTheLastOccurrenceOfAnOptionWin) {
  EXPECT_THAT(RunTool({"-a", "dump", "--action", "plugin"}), Printed(""));
  EXPECT_THAT(RunTool({"-a", "plugin", "-a="}), ShowedUsage());
  EXPECT_THAT(RunTool({"-a", "plugin", "-i", "--info", "-in"}), Printed(""));
  EXPECT_THAT(RunTool({"-a", "position", "-f", "body", "-t", "word", "-t", ""}), Printed("Bad Parameter\n"));
}

TEST(CommandLineTest, CarriesLongAndForeignArguments) {
  const std::string longest(120'000, 'x');
  EXPECT_THAT(RunTool({"-a", "plugin", "-st", longest}), Printed(""));
  EXPECT_THAT(RunTool({"-a", longest}), ShowedUsage());
  EXPECT_THAT(RunTool({"-a", "plugin", "-q", "\xff\xfe", "-d", "späte Wörter"}), Printed(""));
}

class EveryActionTest : public SandboxTest {
 protected:
  Sandbox sandbox_;
};

TEST_F(EveryActionTest, RunsItsOwnBody) {
  const auto run = [&](const std::string& action) { return sandbox_.RunTool({"-a", action}); };
  EXPECT_THAT(run("command"), Aborted("", kErrorType, "Cannot load json: "));
  EXPECT_THAT(run("search"), Aborted("", kErrorType, "index is required."));
  EXPECT_THAT(run("dump"), Aborted("", kErrorType, "index is required."));
  EXPECT_THAT(run("allterm"), Aborted("", "vantrel::elastic::IndexIoError", HasSubstr("empty path")));
  EXPECT_THAT(run("term"), Aborted("", "vantrel::elastic::IndexIoError", HasSubstr("empty path")));
  EXPECT_THAT(run("position"), Printed("Bad Parameter\n"));
  EXPECT_THAT(run("doc_term"), Printed(StartsWith("Bad parameter, must give db path and field name")));
  EXPECT_THAT(run("check"), Aborted("", kErrorType, "db_path is required."));
  EXPECT_THAT(run("repair"), Aborted("", kErrorType, "db_path is required."));
  EXPECT_THAT(run("plugin"), Printed(""));
  EXPECT_THAT(sandbox_.Log(), SizeIs(4));  // search, dump, check, repair
}

TEST_F(EveryActionTest, IsKnownThoughTheUsageDoesNotNameIt) {
  for (const char* action : {"position", "term_suggest"}) {
    EXPECT_THAT(sandbox_.RunTool({"-a", action}).err, Not(HasSubstr("Usage"))) << action;
  }
}

TEST_F(EveryActionTest, IsNotMistakenForAStrayWord) {
  EXPECT_THAT(sandbox_.RunTool({"search", "-a", "vmtouch"}).err,
              AllOf(Not(HasSubstr("Usage")), Not(HasSubstr("index is required."))));
}

TEST(CommandLineTest, PassesOverStrayWordsWhateverTheEnvironmentSays) {
  EXPECT_THAT(RunTool({"search", "-a", "plugin"}, {.environment = {"POSIXLY_CORRECT=1"}}), Printed(""));
}

TEST_F(EveryActionTest, GetsTheOptionOfItsOwnCase) {
  // -i and -I, -p and -P, -d and -D differ in case alone.
  EXPECT_THAT(sandbox_.RunTool({"-a", "dump", "-i"}), Aborted("", kErrorType, "index is required."));
  EXPECT_THAT(sandbox_.RunTool({"-a", "dump", "-I", "idx"}).err, Not(HasSubstr("index is required.")));
  EXPECT_THAT(sandbox_.RunTool({"-a", "check", "-D", "/tmp"}),
              Aborted("", kErrorType, "db_path is required."));
  EXPECT_THAT(sandbox_.RunTool({"-a", "command", "-p", "/no/file", "-P", "/p"}),
              Aborted("", kErrorType, "Cannot load json: /no/file"));
}

TEST(PluginActionTest, DoesNothingAtAll) {
  const TemporaryFolder folder;
  {
    LibraryIndex index(folder.path());
    index.Add({{.name = "body", .value = "text"}});
  }
  const Descriptor watch(inotify_init1(IN_NONBLOCK | IN_CLOEXEC));
  ASSERT_GE(inotify_add_watch(watch.get(), folder.path().c_str(), IN_ALL_EVENTS), 0);
  std::array<char, 4096> events;
  const auto touched = [&] { return read(watch.get(), events.data(), events.size()) > 0; };

  EXPECT_THAT(RunTool({"-a", "plugin",  "-d",  folder.path(), "-p", folder / "segments.gen", "-st", "{}",
                       "-f", "body",    "-t",  "text",        "-I", folder.path(),           "-P",  "p",
                       "-D", "no json", "-si", "-1"},
                      {.input = "unread"}),
              Printed(""));
  EXPECT_FALSE(touched());

  RunTool({"-a", "allterm", "-d", folder.path()});
  EXPECT_TRUE(touched()) << "the watch sees nothing";
}

// An index with one segment of 1500 terms, "word" in each of its three documents.
class ConversionTest : public ::testing::Test {
 protected:
  static constexpr int kTerms = 1500;

  ConversionTest() {
    LibraryIndex index(folder_.path());
    std::string many = "word";
    for (int i = 1; i < kTerms; ++i) many += " t" + std::to_string(i);
    index.Add({{.name = "body", .value = many}});
    index.Add({{.name = "body", .value = "word"}});
    index.Add({{.name = "body", .value = "word"}});
  }

  // How many terms are listed.
  size_t Listed(const std::vector<std::string>& options) const {
    std::vector<std::string> arguments{"-a", "allterm", "-d", folder_.path(), "-i"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    const RunResult run = RunTool(arguments);
    EXPECT_THAT(run, Printed(HasSubstr("total terms: 1500\n")));
    return CountLines(run.out, "field: ");
  }

  std::string Position(const std::vector<std::string>& options) const {
    std::vector<std::string> arguments{"-a", "position", "-d", folder_.path(), "-f", "body", "-t", "word"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    return RunTool(arguments).out;
  }

  TemporaryFolder folder_;
};

TEST_F(ConversionTest, OfTheMaximumStopsAtWhatIsNoDigit) {
  EXPECT_EQ(Listed({"-m", "12abc"}), 12U);
  EXPECT_EQ(Listed({"-m", "12.9"}), 12U);
  EXPECT_EQ(Listed({"-m", "0x10"}), 0U);
  EXPECT_EQ(Listed({"-m", "010"}), 10U);
}

TEST_F(ConversionTest, OfTheMaximumTakesBlanksAndASign) {
  EXPECT_EQ(Listed({"-m", " \t\n 7"}), 7U);
  EXPECT_EQ(Listed({"-m", "+5"}), 5U);
  EXPECT_EQ(Listed({"-m", "-5"}), 0U);
  EXPECT_EQ(Listed({"-m", "- 5"}), 0U);
}

TEST_F(ConversionTest, OfTheMaximumTakesWhatIsNoNumberForNought) {
  EXPECT_EQ(Listed({"-m", "abc"}), 0U);
  EXPECT_EQ(Listed({"-m", ""}), 0U);
}

TEST_F(ConversionTest, OfTheMaximumKeepsAll64BitsAndSaturates) {
  EXPECT_EQ(Listed({"-m", "4294967297"}), 1500U);
  EXPECT_EQ(Listed({"-m", "2147483648"}), 1500U);
  EXPECT_EQ(Listed({"-m", "99999999999999999999"}), 1500U);
  EXPECT_EQ(Listed({"-m", "-4294967295"}), 0U);
  EXPECT_EQ(Listed({"-m", "-99999999999999999999"}), 0U);
}

TEST_F(ConversionTest, OfTheMaximumIsAThousandByDefaultAndTheLastOneWins) {
  EXPECT_EQ(Listed({}), 1000U);
  EXPECT_EQ(Listed({"-m", "3", "--max", "5"}), 5U);
}

TEST_F(ConversionTest, OfADocumentNumberKeepsTheLow32Bits) {
  const std::string first = "pos: 0\ndoc: 0 freq: 1\n";
  const std::string second = "pos: 0\ndoc: 1 freq: 1\n";
  EXPECT_EQ(Position({}), first);
  EXPECT_EQ(Position({"-n", "1"}), second);
  EXPECT_EQ(Position({"-n", "4294967297"}), second);
  EXPECT_EQ(Position({"-n", "-4294967295"}), second);
  EXPECT_EQ(Position({"-n", "1one"}), second);
  EXPECT_EQ(Position({"-n", "one"}), first);
  EXPECT_EQ(Position({"-n", "4294967296"}), first);
  EXPECT_EQ(Position({"-n", "4294967299"}), "No entry!!\n");    // 3
  EXPECT_EQ(Position({"-n", "2147483647"}), "No entry!!\n");    // the greatest
  EXPECT_EQ(Position({"-n", "4294967295"}), first);             // -1
  EXPECT_EQ(Position({"-n", "2147483648"}), first);             // the least
  EXPECT_EQ(Position({"-n", "99999999999999999999"}), first);   // -1, by saturation
  EXPECT_EQ(Position({"-n", "-99999999999999999999"}), first);  // 0, by saturation
  EXPECT_EQ(Position({"-n", "7", "-n", "1"}), second);
}

class SearchValueTest : public SandboxTest {
 protected:
  // What a search with `options` complains of; nothing where its values pass.
  std::string Complaint(const std::vector<std::string>& options) const {
    std::vector<std::string> arguments{"-a", "search", "-I", "idx", "-q", "text"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    const RunResult run = sandbox_.RunTool(arguments);
    for (const char* complaint : {"Invalid size.", "Invalid offset.", "Invalid filter data"}) {
      if (run.err.find(complaint) != std::string::npos) return complaint;
    }
    return "";
  }

  Sandbox sandbox_;
};

TEST_F(SearchValueTest, IsConvertedLikeAnyNumberWithAll64Bits) {
  for (const auto& [option, complaint] :
       {std::pair("--size", "Invalid size."), std::pair("--offset", "Invalid offset.")}) {
    for (const char* bad : {"-1", "-5", " -1x", "-9223372036854775808", "-99999999999999999999"}) {
      EXPECT_EQ(Complaint({option, bad}), complaint) << option << ' ' << bad;
    }
    for (const char* good : {"0", "-0", "x-1", "", "4294967295", "2147483648", "99999999999999999999"}) {
      EXPECT_EQ(Complaint({option, good}), "") << option << ' ' << good;
    }
  }
  EXPECT_EQ(Complaint({}), "");
}

}  // namespace
}  // namespace quorelastic::testing
