// The checks that reject an option's value: the system log's line, the exception, the end of the run.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "support/sandbox_test.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

struct RejectedRun {
  std::string name;
  std::vector<std::string> arguments;
  std::string place;  // up to the process id
  std::string check;  // from the function on
  std::string reason;
};

// What the tests' names and messages show.
void PrintTo(const RejectedRun& run, std::ostream* stream) { *stream << run.name; }

// The line without the C library's timestamp, whose shape is checked all the same.
std::string WithoutTime(const std::string& line) {
  constexpr char kPattern[] = "<11>Aaa dd 00:00:00 ";
  const size_t length = sizeof(kPattern) - 1;
  if (line.size() < length) return "no timestamp in: " + line;
  for (const size_t at : {13U, 16U}) {
    if (line[at] != ':') return "no timestamp in: " + line;
  }
  return line.substr(0, 4) + line.substr(length);
}

std::string ExpectedLine(const RejectedRun& run, pid_t process) {
  return "<11>quorelastic: " + run.place + " (" + std::to_string(process) + ", " + std::to_string(geteuid()) +
         ") " + run.check + ", reason: " + run.reason;
}

std::vector<std::string> LogOf(Sandbox& sandbox) {
  std::vector<std::string> lines;
  for (const std::string& line : sandbox.Log()) lines.push_back(WithoutTime(line));
  return lines;
}

class RejectedRunTest : public SandboxTest, public ::testing::WithParamInterface<RejectedRun> {};

TEST_P(RejectedRunTest, LeavesOneLineInTheSystemLogAndEndsByAnException) {
  Sandbox sandbox;
  const RunResult run = sandbox.RunTool(GetParam().arguments);
  EXPECT_THAT(run, Aborted("", kErrorType, GetParam().reason));
  EXPECT_THAT(LogOf(sandbox), ElementsAre(ExpectedLine(GetParam(), run.pid)));
}

const RejectedRun kRejectedRuns[] = {
    {"SearchWithoutIndex",
     {"-a", "search", "-q", "text"},
     "quorelastic.cpp:133",
     "(DoSearch) Failed [index_id.empty()]",
     "index is required."},
    {"SearchWithoutQuery",
     {"-a", "search", "-I", "idx"},
     "quorelastic.cpp:134",
     "(DoSearch) Failed [query_string.empty()]",
     "query string is required."},
    {"SearchOfNegativeSize",
     {"-a", "search", "-I", "idx", "-q", "text", "-si", "-1"},
     "quorelastic.cpp:135",
     "(DoSearch) Failed [0 > size]",
     "Invalid size."},
    {"SearchFromNegativeOffset",
     {"-a", "search", "-I", "idx", "-q", "text", "-o", "-5"},
     "quorelastic.cpp:136",
     "(DoSearch) Failed [0 > offset]",
     "Invalid offset."},
    {"SearchWithFilterDataThatIsNoJson",
     {"-a", "search", "-I", "idx", "-q", "text", "-D", "{\"a\":"},
     "quorelastic.cpp:138",
     "(DoSearch) Failed [!filter_data.empty() && !js_filter_data.fromString(filter_data)]",
     "Invalid filter data"},
    {"DumpWithoutIndex",
     {"-a", "dump"},
     "quorelastic.cpp:163",
     "(DoDumpDB) Failed [index_id.empty()]",
     "index is required."},
    {"CheckWithoutFolder",
     {"-a", "check"},
     "quorelastic.cpp:321",
     "(Check) Failed [db_path.empty()]",
     "db_path is required."},
    {"RepairWithoutFolder",
     {"-a", "repair"},
     "quorelastic.cpp:332",
     "(Repair) Failed [db_path.empty()]",
     "db_path is required."},
};

INSTANTIATE_TEST_SUITE_P(EveryCheck, RejectedRunTest, ::testing::ValuesIn(kRejectedRuns),
                         [](const auto& instance) { return instance.param.name; });

class FailureLogTest : public SandboxTest {
 protected:
  Sandbox sandbox_;
};

TEST_F(FailureLogTest, TellsTheErrorThatAnOptionTooLongForItsTypeLeftBehind) {
  const RunResult run = sandbox_.RunTool({"-a", "dump", "-m", "99999999999999999999"});
  EXPECT_THAT(run, Aborted("", kErrorType, "index is required."));
  EXPECT_THAT(LogOf(sandbox_),
              ElementsAre(EndsWith(") (DoDumpDB) Failed [index_id.empty()], reason: index is "
                                   "required. [err: Numerical result out of range]")));
}

// Counting the processors, as a library does before main begins, fails there and leaves errno set.
TEST_F(FailureLogTest, HasNoErrorFromBeforeTheRunOnAMachineWithoutSys) {
  sandbox_.Hide("/sys");
  const RunResult run = sandbox_.RunTool({"-a", "dump"});
  EXPECT_THAT(run, Aborted("", kErrorType, "index is required."));
  EXPECT_THAT(LogOf(sandbox_), ElementsAre(EndsWith("reason: index is required.")));
}

TEST_F(FailureLogTest, HasNoErrorThatAStaticInitialiserLeftBehind) {
  const char* const own = std::getenv("ASAN_OPTIONS");
  // The address sanitizer otherwise insists on being the first library.
  const std::string sanitizer =
      "ASAN_OPTIONS=" + std::string(own == nullptr ? "" : own) + ":verify_asan_link_order=0";
  const RunResult run = sandbox_.RunCommand(
      {"env", std::string("LD_PRELOAD=") + STALE_ERRNO_LIBRARY, sanitizer, ToolPath(), "-a", "dump"});
  EXPECT_THAT(run, Aborted("", kErrorType, "index is required."));
  EXPECT_THAT(LogOf(sandbox_), ElementsAre(EndsWith("reason: index is required.")));
}

TEST_F(FailureLogTest, NamesTheFirstOfSeveralBadValues) {
  const RunResult run = sandbox_.RunTool({"-a", "search", "-si", "-1", "-o", "-1", "-D", "{"});
  EXPECT_THAT(run, Aborted("", kErrorType, "index is required."));
  const RunResult indexed = sandbox_.RunTool({"-a", "search", "-I", "i", "-si", "-1", "-o", "-1", "-D", "{"});
  EXPECT_THAT(indexed, Aborted("", kErrorType, "query string is required."));
  const RunResult queried =
      sandbox_.RunTool({"-a", "search", "-I", "i", "-q", "q", "-si", "-1", "-o", "-1", "-D", "{"});
  EXPECT_THAT(queried, Aborted("", kErrorType, "Invalid size."));
  const RunResult sized = sandbox_.RunTool({"-a", "search", "-I", "i", "-q", "q", "-o", "-1", "-D", "{"});
  EXPECT_THAT(sized, Aborted("", kErrorType, "Invalid offset."));
  EXPECT_THAT(LogOf(sandbox_), ElementsAre(HasSubstr(":133 ("), HasSubstr(":134 ("), HasSubstr(":135 ("),
                                           HasSubstr(":136 (")));
}

TEST_F(FailureLogTest, TakesABlankFilterForNoJson) {
  const RunResult run = sandbox_.RunTool({"-a", "search", "-I", "i", "-q", "q", "-D", " "});
  EXPECT_THAT(run, Aborted("", kErrorType, "Invalid filter data"));
  EXPECT_THAT(LogOf(sandbox_), ElementsAre(HasSubstr(":138 (")));
}

TEST_F(FailureLogTest, HasNoLineForASearchWhoseValuesAreGood) {
  const std::vector<std::string> search{"-a", "search", "-I", "idx", "-q", "text"};
  const std::vector<std::vector<std::string>> good = {
      {},          {"-si", "0", "-o", "0"}, {"-si", "4294967295", "-o", "4294967295"},
      {"-D", ""},  {"-D", "null"},          {"-D", "[1, \"two\"]"},
      {"-D", "{}"}};
  for (std::vector<std::string> arguments : good) {
    arguments.insert(arguments.begin(), search.begin(), search.end());
    EXPECT_THAT(sandbox_.RunTool(arguments).err, Not(HasSubstr("vantrel::Error")));
  }
  EXPECT_THAT(LogOf(sandbox_), IsEmpty());
}

TEST_F(FailureLogTest, HasNoLineForAJsonFileThatCannotBeLoaded) {
  const RunResult run = sandbox_.RunTool({"-a", "command", "-p", "/no such/file.json"});
  EXPECT_THAT(run, Aborted("", kErrorType, "Cannot load json: /no such/file.json"));
  EXPECT_THAT(LogOf(sandbox_), IsEmpty());
}

TEST_F(FailureLogTest, HasNoLineForARejectedOptionOrAMissingAction) {
  EXPECT_THAT(sandbox_.RunTool({"-S", "20"}), Rejected('?', HasSubstr("-S")));
  EXPECT_THAT(sandbox_.RunTool({}), ShowedUsage());
  EXPECT_THAT(LogOf(sandbox_), IsEmpty());
}

}  // namespace
}  // namespace quorelastic::testing
