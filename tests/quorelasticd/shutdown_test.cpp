// How a daemon ends, in good order or not, and what outlives it.

#include <gtest/gtest.h>
#include <linux/sockios.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "quordaemon/wire.h"
#include "served_index.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

constexpr const char* kCreate =
    R"({"command":"index_create","data":{"id":"x","settings":{"fields":[{"name":"t","type":"text"}]}}})";
constexpr const char* kCountRequest = R"({"command":"index_list","data":{"id":"x"}})";
constexpr const char* kAllTerms = R"({"command":"terms","data":{"id":"x","max":1000000}})";

int Count(DaemonClient& client) {
  return client.Ask(kCountRequest)["result"]["indexes"][0]["documents"].asInt();
}

std::string AddRequest(const std::string& id, bool commit) {
  return R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":")" + id + R"("}],"commit":)" +
         (commit ? "true" : "false") + "}}";
}

// So many terms that their replies fill a socket many times over.
std::string AddManyWordsRequest() {
  return R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":"1","t":")" + ManyWords(50000) +
         "\"}]}}";
}

TEST(Shutdown, CommittedDocumentsOutliveARestartAndAKill) {
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

TEST(Shutdown, WhatWasNotCommittedIsCommittedAtTheEnd) {
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

// Of a request, so many bytes come before the signal.
class ShutdownWithin : public ::testing::TestWithParam<size_t> {};

TEST_P(ShutdownWithin, ARequestThatComesTooLateIsRefused) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  const std::string request = R"({"command":"status"})";
  const auto header = quordaemon::EncodeHeader(static_cast<uint32_t>(request.size()));
  const std::string bytes = std::string(header.begin(), header.end()) + request;
  ASSERT_EQ(send(client.descriptor(), bytes.data(), GetParam(), MSG_NOSIGNAL),
            static_cast<ssize_t>(GetParam()));
  // Until the daemon has read them, the request has not begun.
  for (int unread = 1; unread > 0; std::this_thread::sleep_for(std::chrono::milliseconds(5))) {
    ASSERT_EQ(ioctl(client.descriptor(), SIOCOUTQ, &unread), 0);
  }
  daemon.Signal(SIGTERM);
  while (daemon.Notifications().size() < 2) std::this_thread::sleep_for(std::chrono::milliseconds(5));
  std::this_thread::sleep_for(std::chrono::milliseconds(50));
  ASSERT_EQ(send(client.descriptor(), bytes.data() + GetParam(), bytes.size() - GetParam(), MSG_NOSIGNAL),
            static_cast<ssize_t>(bytes.size() - GetParam()));
  EXPECT_EQ(client.Receive()["error"]["code"].asString(), "shutting_down");
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_EQ(daemon.Wait(), 0);
}

INSTANTIATE_TEST_SUITE_P(Header, ShutdownWithin, ::testing::Values(1, 3));
INSTANTIATE_TEST_SUITE_P(Payload, ShutdownWithin, ::testing::Values(4, 10));

TEST(Shutdown, AClientThatStopsWithinAHeaderHoldsUpNobodyForLong) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path(), {"--stall-timeout", "1"});
  DaemonClient client(daemon.socket());
  ASSERT_EQ(send(client.descriptor(), "\0", 1, MSG_NOSIGNAL), 1);
  ASSERT_EQ(DaemonClient(daemon.socket()).AskForError(R"({"command":"status"})"), "");
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(daemon.Stop(), 0);
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(20));
  EXPECT_TRUE(client.IsHungUp());
}

TEST(Shutdown, RequestsThatWaitForTheirTurnAreRefusedOnceTheStreamBeforeThemIsDone) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  ASSERT_EQ(client.AskForError(kCreate), "");
  ASSERT_EQ(client.AskForError(AddManyWordsRequest()), "");
  ASSERT_TRUE(client.Send(kAllTerms));
  ASSERT_TRUE(client.Send(R"({"command":"status"})"));
  client.Receive();
  daemon.Signal(SIGTERM);
  while (daemon.Notifications().size() < 2) std::this_thread::sleep_for(std::chrono::milliseconds(5));
  EXPECT_TRUE(client.ReceiveFinal()["success"].asBool());
  EXPECT_EQ(client.Receive()["error"]["code"].asString(), "shutting_down");
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_EQ(daemon.Wait(), 0);
}

TEST(Shutdown, AStreamUnderWayIsFinishedFirst) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  DaemonClient client(daemon.socket());
  ASSERT_EQ(client.AskForError(kCreate), "");
  ASSERT_EQ(client.AskForError(AddManyWordsRequest()), "");
  ASSERT_TRUE(client.Send(kAllTerms));
  client.Receive();
  daemon.Signal(SIGTERM);
  EXPECT_EQ(client.ReceiveFinal()["result"]["count"].asInt(), 50001);
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_EQ(daemon.Wait(), 0);
}

TEST(Shutdown, AClientThatNeverReadsIsCutOffAtTheEnd) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path(), {"--shutdown-timeout", "1"});
  DaemonClient client(daemon.socket());
  ASSERT_EQ(client.AskForError(kCreate), "");
  ASSERT_EQ(client.AskForError(AddManyWordsRequest()), "");
  ASSERT_TRUE(client.Send(kAllTerms));
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

TEST(Shutdown, NothingAcknowledgedIsLostInAShutdownUnderLoad) { EndUnderLoad(SIGTERM, 0); }

TEST(Shutdown, NothingAcknowledgedIsLostInAKillUnderLoad) { EndUnderLoad(SIGKILL, -SIGKILL); }

}  // namespace
}  // namespace quorelastic::testing
