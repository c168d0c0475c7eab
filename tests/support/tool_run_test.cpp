// The harness itself: what it reports of programs whose end is known.

#include "support/tool_run.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "support/files.h"
#include "support/sandbox_test.h"

namespace quorelastic::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::SizeIs;

RunResult Shell(const std::string& script, const RunOptions& options = {}) {
  return RunCommand({"sh", "-c", script}, options);
}

TEST(ToolRunTest, ReportsOutputAndStatus) {
  const RunResult run = Shell("echo out; echo err >&2; exit 7");
  EXPECT_EQ(run.out, "out\n");
  EXPECT_EQ(run.err, "err\n");
  EXPECT_EQ(run.status, 7);
  EXPECT_EQ(run.signal, 0);
}

TEST(ToolRunTest, ReportsTheSignalThatEndedARun) {
  const RunResult run = Shell("kill -ABRT $$");
  EXPECT_EQ(run.status, -1);
  EXPECT_EQ(run.signal, SIGABRT);
}

TEST(ToolRunTest, PassesInputEnvironmentFolderAndLimits) {
  EXPECT_EQ(RunCommand({"cat"}, {.input = "given"}).out, "given");
  EXPECT_EQ(Shell("echo $NAME", {.environment = {"NAME=value"}}).out, "value\n");
  EXPECT_EQ(Shell("pwd", {.folder = "/usr"}).out, "/usr\n");
  EXPECT_EQ(Shell("ulimit -n", {.limits = {{RLIMIT_NOFILE, 23}}}).out, "23\n");
}

TEST(ToolRunTest, SaysWhyAProgramCannotBeRun) {
  const RunResult run = RunCommand({"/no/such/program"});
  EXPECT_EQ(run.status, 127);
  EXPECT_EQ(run.err, "cannot run /no/such/program: No such file or directory\n");
}

TEST(ToolRunTest, KillsWhatDoesNotEndInTime) {
  try {
    Shell("echo started; sleep 1000", {.time_limit = std::chrono::seconds(1)});
    FAIL() << "it ended";
  } catch (const std::runtime_error& error) {
    EXPECT_THAT(error.what(), HasSubstr("did not end within 1 s; until then it wrote\nstarted\n"));
  }
}

TEST(ToolRunTest, KeepsEveryWriteApart) {
  EXPECT_THAT(Shell("printf one; printf 'two\\n'", {.record_writes = true}).writes,
              ElementsAre("one", "two\n"));
}

class SandboxedRunTest : public SandboxTest {
 protected:
  RunResult Shell(const std::string& script) const { return sandbox_.RunCommand({"sh", "-c", script}); }

  Sandbox sandbox_;
};

TEST_F(SandboxedRunTest, KnowsTheProcessAndTheSignalThatEndedIt) {
  const RunResult run = Shell("echo $$; kill -ABRT $$");
  EXPECT_EQ(run.out, std::to_string(run.pid) + "\n");
  EXPECT_EQ(run.signal, SIGABRT);
  EXPECT_EQ(run.status, -1);
}

TEST_F(SandboxedRunTest, MayWriteToItsOwnPlacesAlone) {
  const TemporaryFolder elsewhere;
  EXPECT_EQ(
      Shell("echo 1 > /var/run/a && echo 2 > /var/lib/quorelastic/b && echo 3 > " + sandbox_.folder() + "/c")
          .status,
      0);
  EXPECT_EQ(ReadFile(sandbox_.run_folder() + "/a"), "1\n");
  EXPECT_EQ(ReadFile(sandbox_.data_root() + "/b"), "2\n");
  EXPECT_EQ(ReadFile(sandbox_.folder() + "/c"), "3\n");
  EXPECT_THAT(Shell("touch " + elsewhere.path() + "/d").err, HasSubstr("Read-only file system"));
}

TEST_F(SandboxedRunTest, SharesItsRunFolderWithALastingProgram) {
  Process lasting = sandbox_.Start({"sh", "-c", "mkfifo /run/fifo; echo ready; cat /run/fifo"});
  while (lasting.Out() != "ready\n") std::this_thread::sleep_for(std::chrono::milliseconds(2));
  EXPECT_EQ(Shell("echo hello > /var/run/fifo").status, 0);
  EXPECT_EQ(lasting.Wait().out, "ready\nhello\n");
}

TEST_F(SandboxedRunTest, HasALogOfItsOwnHoweverMuchIsWritten) {
  Sandbox other;
  EXPECT_EQ(Shell("for i in $(seq 100); do logger -t test message $i; done").status, 0);
  EXPECT_THAT(sandbox_.Log(), SizeIs(100));
  EXPECT_THAT(sandbox_.Log().back(), EndsWith("test: message 100"));
  EXPECT_THAT(other.Log(), SizeIs(0));
}

}  // namespace
}  // namespace quorelastic::testing
