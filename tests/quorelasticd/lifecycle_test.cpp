// How a daemon starts, and what it tells the service manager and leaves behind.

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <string>
#include <thread>

#include "daemon_client.h"
#include "daemon_process.h"
#include "support/files.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::HasSubstr;

TEST(Lifecycle, ItTellsTheServiceManagerWhatItDoes) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  EXPECT_TRUE(daemon.is_ready());
  EXPECT_EQ(daemon.Stop(), 0);
  const auto said = daemon.Notifications();
  ASSERT_EQ(said.size(), 2u);
  EXPECT_EQ(said[0], "READY=1\nSTATUS=Serving on " + daemon.socket());
  EXPECT_EQ(said[1], "STOPPING=1\nSTATUS=Finishing what is running");
}

TEST(Lifecycle, AServiceManagerThatWatchesItIsToldThatItIsAliveUntilItStops) {
  const TemporaryFolder folder;
  setenv("WATCHDOG_USEC", "1500000", 1);
  DaemonProcess daemon(folder.path());
  unsetenv("WATCHDOG_USEC");
  const auto beats = [&] {
    const auto said = daemon.Notifications();
    return std::count(said.begin(), said.end(), "WATCHDOG=1");
  };
  const auto earlier = beats();
  const auto start = std::chrono::steady_clock::now();
  while (beats() < earlier + 3) {
    ASSERT_LT(std::chrono::steady_clock::now() - start, 3 * std::chrono::milliseconds(1500)) << "it is ended";
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  // A third of the time that was given lies between two of them; not as often as it can.
  EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(900));
  EXPECT_EQ(daemon.Stop(), 0);
  EXPECT_EQ(daemon.Notifications().back(), "STOPPING=1\nSTATUS=Finishing what is running");
}

TEST(Lifecycle, TheSocketIsForOwnerAndGroupAndGoesWithTheDaemon) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  struct stat status {};
  ASSERT_EQ(stat(daemon.socket().c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0660u);
  daemon.Stop();
  EXPECT_FALSE(fs::exists(daemon.socket()));
}

TEST(Lifecycle, BothSignalsEndItInGoodOrder) {
  for (const int signal : {SIGTERM, SIGINT}) {
    const TemporaryFolder folder;
    DaemonProcess daemon(folder.path());
    DaemonClient idle(daemon.socket());
    daemon.Signal(signal);
    EXPECT_EQ(daemon.Wait(), 0);
    EXPECT_TRUE(idle.IsHungUp());
  }
}

TEST(Lifecycle, ASocketThatADeadDaemonLeftIsTakenOver) {
  const TemporaryFolder folder;
  {
    DaemonProcess killed(folder.path());
    killed.Signal(SIGKILL);
    EXPECT_EQ(killed.Wait(), -SIGKILL);
    EXPECT_TRUE(fs::exists(killed.socket()));
  }
  DaemonProcess daemon(folder.path());
  ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
  EXPECT_EQ(DaemonClient(daemon.socket()).AskForError(R"({"command":"status"})"), "");
}

TEST(Lifecycle, ASocketThatSomebodyAnswersOnIsLeftAlone) {
  const TemporaryFolder folder;
  DaemonProcess first(folder.path());
  const ProgramRun second = RunDaemonProgram({"--socket", first.socket(), "--data", folder / "other"});
  EXPECT_EQ(second.status, 1);
  EXPECT_THAT(second.output, HasSubstr("somebody answers on this socket already"));
  EXPECT_EQ(DaemonClient(first.socket()).AskForError(R"({"command":"status"})"), "");
}

TEST(Lifecycle, AFileThatIsNoSocketIsLeftAlone) {
  const TemporaryFolder folder;
  WriteFile(folder / "file", "precious");
  const ProgramRun run = RunDaemonProgram({"--socket", folder / "file", "--data", folder / "data"});
  EXPECT_EQ(run.status, 1);
  EXPECT_THAT(run.output, HasSubstr("exists, and is no socket"));
  EXPECT_EQ(ReadFile(folder / "file"), "precious");
}

TEST(Lifecycle, ASecondDaemonOnTheSameDataIsRefused) {
  const TemporaryFolder folder;
  DaemonProcess first(folder.path());
  const ProgramRun second = RunDaemonProgram({"--socket", folder / "other", "--data", first.data()});
  EXPECT_EQ(second.status, 1);
  EXPECT_THAT(second.output, HasSubstr(first.data() + ": another daemon runs on this data folder"));
  EXPECT_FALSE(fs::exists(folder / "other"));
}

TEST(Lifecycle, ABadCommandLineIsOneLineAndStatusTwo) {
  const ProgramRun run = RunDaemonProgram({"--thread", "4"});
  EXPECT_EQ(run.status, 2);
  EXPECT_EQ(run.output, "quorelasticd: unrecognised option '--thread'\n");
}

TEST(Lifecycle, HelpAndVersionGoToStandardOutput) {
  EXPECT_THAT(RunDaemonProgram({"--version"}).output, ::testing::StartsWith("quorelasticd "));
  const ProgramRun help = RunDaemonProgram({"--help"});
  EXPECT_EQ(help.status, 0);
  EXPECT_THAT(help.output, HasSubstr("--data FOLDER"));
}

TEST(Lifecycle, TheServiceManagersSocketIsServedAndLeftThere) {
  const TemporaryFolder folder;
  const std::string path = folder / "activated";
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::memcpy(address.sun_path, path.data(), path.size());
  const int listener = socket(AF_UNIX, SOCK_STREAM, 0);
  ASSERT_EQ(bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
  ASSERT_EQ(listen(listener, 8), 0);
  DaemonProcess daemon(folder.path(), {}, listener);
  ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
  EXPECT_EQ(daemon.Notifications()[0], "READY=1\nSTATUS=Serving on " + path);
  EXPECT_FALSE(fs::exists(daemon.socket()));
  EXPECT_EQ(DaemonClient(path).AskForError(R"({"command":"status"})"), "");
  EXPECT_EQ(daemon.Stop(), 0);
  EXPECT_TRUE(fs::exists(path));
  close(listener);
}

}  // namespace
}  // namespace quorelastic::testing
