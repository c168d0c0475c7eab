// How a daemon starts, ends, and what outlives it.

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <iterator>
#include <memory>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "quordaemon/wire.h"
#include "served_index.h"
#include "support/files.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::HasSubstr;

constexpr const char* kCreate =
    R"({"command":"index_create","data":{"id":"x","settings":{"fields":[{"name":"t","type":"text"}]}}})";
constexpr const char* kCountRequest = R"({"command":"index_list","data":{"id":"x"}})";

int Count(DaemonClient& client) {
  return client.Ask(kCountRequest)["result"]["indexes"][0]["documents"].asInt();
}

std::string AddRequest(const std::string& id, bool commit) {
  return R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":")" + id + R"("}],"commit":)" +
         (commit ? "true" : "false") + "}}";
}

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

TEST(Lifecycle, CommittedDocumentsOutliveARestartAndAKill) {
  const TemporaryFolder folder;
  {
    DaemonProcess daemon(folder.path());
    DaemonClient client(daemon.socket());
    ASSERT_EQ(client.AskForError(kCreate), "");
    ASSERT_EQ(client.AskForError(AddRequest("1", true)), "");
    EXPECT_EQ(daemon.Stop(), 0);
  }
  {
    DaemonProcess daemon(folder.path());
    DaemonClient client(daemon.socket());
    EXPECT_EQ(Count(client), 1);
    ASSERT_EQ(client.AskForError(AddRequest("2", true)), "");
    ASSERT_EQ(client.AskForError(AddRequest("lost", false)), "");
    daemon.Signal(SIGKILL);
    daemon.Wait();
  }
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  EXPECT_EQ(Count(client), 2);
}

TEST(Lifecycle, WhatWasNotCommittedIsCommittedAtTheEnd) {
  const TemporaryFolder folder;
  {
    DaemonProcess daemon(folder.path());
    DaemonClient client(daemon.socket());
    ASSERT_EQ(client.AskForError(kCreate), "");
    ASSERT_EQ(client.AskForError(AddRequest("1", false)), "");
    EXPECT_EQ(daemon.Stop(), 0);
  }
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  EXPECT_EQ(Count(client), 1);
}

TEST(Lifecycle, ARequestThatComesTooLateIsRefused) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  const std::string request = R"({"command":"status"})";
  const auto header = quordaemon::EncodeHeader(static_cast<uint32_t>(request.size()));
  const std::string bytes = std::string(header.begin(), header.end()) + request;
  ASSERT_EQ(send(client.descriptor(), bytes.data(), 10, MSG_NOSIGNAL), 10);
  // Once another client that came later is served, ours has been accepted too.
  ASSERT_EQ(DaemonClient(daemon.socket()).AskForError(request), "");
  daemon.Signal(SIGTERM);
  while (daemon.Notifications().size() < 2) std::this_thread::sleep_for(std::chrono::milliseconds(5));
  std::this_thread::sleep_for(std::chrono::milliseconds(50));
  ASSERT_EQ(send(client.descriptor(), bytes.data() + 10, bytes.size() - 10, MSG_NOSIGNAL),
            static_cast<ssize_t>(bytes.size()) - 10);
  EXPECT_EQ(client.Receive()["error"]["code"].asString(), "shutting_down");
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_EQ(daemon.Wait(), 0);
}

TEST(Lifecycle, RequestsThatWaitForTheirTurnAreRefusedOnceTheStreamBeforeThemIsDone) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  ASSERT_EQ(client.AskForError(kCreate), "");
  ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":"1","t":")" +
                               ManyWords(50000) + "\"}]}}"),
            "");
  ASSERT_TRUE(client.Send(R"({"command":"terms","data":{"id":"x","max":1000000}})"));
  ASSERT_TRUE(client.Send(R"({"command":"status"})"));
  client.Receive();
  daemon.Signal(SIGTERM);
  while (daemon.Notifications().size() < 2) std::this_thread::sleep_for(std::chrono::milliseconds(5));
  JsonValue reply;
  do {
    reply = client.Receive();
  } while (!reply.isMember("success"));
  EXPECT_TRUE(reply["success"].asBool());
  EXPECT_EQ(client.Receive()["error"]["code"].asString(), "shutting_down");
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_EQ(daemon.Wait(), 0);
}

TEST(Lifecycle, AStreamUnderWayIsFinishedFirst) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  ASSERT_EQ(client.AskForError(kCreate), "");
  const std::string words = ManyWords(50000);
  ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":"1","t":")" +
                               words + "\"}]}}"),
            "");
  ASSERT_TRUE(client.Send(R"({"command":"terms","data":{"id":"x","max":1000000}})"));
  client.Receive();
  daemon.Signal(SIGTERM);
  JsonValue reply;
  do {
    reply = client.Receive();
  } while (!reply.isMember("success"));
  EXPECT_EQ(reply["result"]["count"].asInt(), 50001);
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_EQ(daemon.Wait(), 0);
}

TEST(Lifecycle, AClientThatNeverReadsIsCutOffAtTheEnd) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path(), {"--shutdown-timeout", "1"});
  DaemonClient client(daemon.socket());
  ASSERT_EQ(client.AskForError(kCreate), "");
  const std::string words = ManyWords(50000);
  ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":"1","t":")" +
                               words + "\"}]}}"),
            "");
  ASSERT_TRUE(client.Send(R"({"command":"terms","data":{"id":"x","max":1000000}})"));
  client.Receive();
  EXPECT_EQ(daemon.Stop(), 0);
}

// Clients add documents, one a commit, until the daemon goes; whatever was acknowledged must be there afterwards.
void EndUnderLoad(int signal, int expected_status) {
  const TemporaryFolder folder;
  std::vector<std::set<std::string>> acknowledged(8);
  {
    DaemonProcess daemon(folder.path());
    ASSERT_EQ(DaemonClient(daemon.socket()).AskForError(kCreate), "");
    std::atomic<int> commits{0};
    std::vector<std::thread> threads;
    for (size_t c = 0; c < acknowledged.size(); ++c) {
      threads.emplace_back([&, c] {
        try {
          DaemonClient client(daemon.socket());
          for (int i = 0;; ++i) {
            const std::string id = std::to_string(c) + "-" + std::to_string(i);
            const JsonValue reply = client.Ask(AddRequest(id, true));
            if (!reply["success"].asBool()) break;
            acknowledged[c].insert(id);
            ++commits;
          }
        } catch (const std::runtime_error&) {
          // the daemon hung up
        }
      });
    }
    while (commits < 40) std::this_thread::sleep_for(std::chrono::milliseconds(1));
    daemon.Signal(signal);
    EXPECT_EQ(daemon.Wait(), expected_status);
    for (std::thread& thread : threads) thread.join();
  }
  DaemonProcess daemon(folder.path());
  ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
  DaemonClient client(daemon.socket());
  std::set<std::string> found;
  for (const JsonValue& reply :
       client.Exchange(R"({"command":"terms","data":{"id":"x","field":"id","live":true,"max":1000000}})")) {
    for (const Json::Value& term : reply["progress"]["terms"]) found.insert(term["text"].asString());
  }
  for (const auto& ids : acknowledged) {
    for (const std::string& id : ids) EXPECT_TRUE(found.contains(id)) << id;
  }
}

TEST(Lifecycle, NothingAcknowledgedIsLostInAShutdownUnderLoad) { EndUnderLoad(SIGTERM, 0); }

TEST(Lifecycle, NothingAcknowledgedIsLostInAKillUnderLoad) { EndUnderLoad(SIGKILL, -SIGKILL); }

size_t CountDescriptors(pid_t pid) {
  const fs::directory_iterator entries("/proc/" + std::to_string(pid) + "/fd");
  return static_cast<size_t>(std::distance(fs::begin(entries), fs::end(entries)));
}

TEST(Lifecycle, MoreIndexesThanMayBeOpenAreAllServedWithFewDescriptors) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path(), {"--max-open-indexes", "5"});
  constexpr int kIndexes = 60;
  const auto name = [](int i) { return "\"x" + std::to_string(i) + "\""; };
  const auto search = [&](DaemonClient& client, int i) {
    return client.Ask(R"({"command":"search","data":{"indice":[)" + name(i) +
                      R"(],"query_string":{"query":"word"}}})")["result"]["total"];
  };
  size_t most = 0;
  DaemonClient client(daemon.socket());
  for (int i = 0; i < kIndexes; ++i) {
    ASSERT_EQ(client.AskForError(R"({"command":"index_create","data":{"id":)" + name(i) +
                                 R"(,"settings":{"fields":[{"name":"t","type":"text"}]}}})"),
              "");
    // Every other one is left with a change that is not committed.
    ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":)" + name(i) +
                                 R"(,"documents":[{"id":"1","t":"word"}]}})"),
              "");
    ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":)" + name(i) +
                                 R"(,"documents":[{"id":"2","t":"word"}],"commit":)" +
                                 (i % 2 == 0 ? "true" : "false") + "}}"),
              "");
    EXPECT_GE(search(client, i), i % 2 == 0 ? 2 : 1);
    most = std::max(most, CountDescriptors(daemon.pid()));
  }
  for (int i = 0; i < kIndexes; ++i) EXPECT_GE(search(client, i), i % 2 == 0 ? 2 : 1) << i;
  most = std::max(most, CountDescriptors(daemon.pid()));
  EXPECT_LT(most, 200U);
  // What has changes is committed in the background, and closed when the next index is opened.
  const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(60);
  int opened = 0;
  while (client.Ask(R"({"command":"status"})")["result"]["open_indexes"].asInt() > 5) {
    ASSERT_LT(std::chrono::steady_clock::now(), give_up);
    search(client, opened++ % kIndexes);
  }
  ASSERT_EQ(daemon.Stop(), 0);
  DaemonProcess again(folder.path());
  DaemonClient other(again.socket());
  for (int i = 0; i < kIndexes; ++i) EXPECT_EQ(search(other, i), 2) << i;
}

}  // namespace
}  // namespace quorelastic::testing
