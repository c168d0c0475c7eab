// Many clients, slow clients, clients that vanish.

#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/socket.h>

#include <atomic>
#include <chrono>
#include <fstream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "quordaemon/wire.h"
#include "served_index.h"
#include "support/sanitized.h"
#include "support/text_search.h"

namespace quorelastic::testing {
namespace {

using std::chrono::steady_clock;

class ConnectionsTest : public ServedIndex {
 protected:
  explicit ConnectionsTest(const std::vector<std::string>& arguments = {"--stall-timeout", "300"})
      : ServedIndex(arguments) {}

  // One document with so many words that its terms fill every socket buffer many times over.
  void AddManyWords() {
    const std::string words = ManyWords(kManyWords);
    ASSERT_EQ(Connect().AskForError(
                  R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1","title":")" +
                  words + "\"}]}}"),
              "");
  }

  // Bytes of memory that the daemon holds.
  size_t Resident() const {
    std::ifstream file("/proc/" + std::to_string(daemon_.pid()) + "/statm");
    size_t all = 0;
    size_t resident = 0;
    file >> all >> resident;
    return resident * 4096;
  }

  static constexpr int kManyWords = 80000;
  static constexpr const char* kAllTerms = R"({"command":"terms","data":{"id":"books","max":1000000}})";
};

TEST_F(ConnectionsTest, AClientWaitsWhileDescriptorsHaveRunOutAndTheLogTellsItOnce) {
  if (kIsSanitized) GTEST_SKIP() << kSanitizerNeedsDescriptors;
  rlimit before{};
  ASSERT_EQ(prlimit(daemon_.pid(), RLIMIT_NOFILE, nullptr, &before), 0);
  const rlimit none{.rlim_cur = 1, .rlim_max = before.rlim_max};
  ASSERT_EQ(prlimit(daemon_.pid(), RLIMIT_NOFILE, &none, nullptr), 0);
  DaemonClient client = Connect();
  ASSERT_TRUE(client.Send(R"({"command":"status"})"));
  std::this_thread::sleep_for(std::chrono::milliseconds(700));  // several tries
  EXPECT_THAT(FindAll(daemon_.Log(), "(cannot accept a client): Too many open files"), ::testing::SizeIs(1));
  ASSERT_EQ(prlimit(daemon_.pid(), RLIMIT_NOFILE, &before, nullptr), 0);
  EXPECT_TRUE(client.Receive()["success"].asBool());
}

TEST_F(ConnectionsTest, PipelinedRequestsAreAnsweredInTheirOrder) {
  DaemonClient client = Connect();
  constexpr int kRequests = 200;
  for (int i = 0; i < kRequests; ++i) {
    const char* command = i % 3 == 0 ? "status" : i % 3 == 1 ? "index_list" : "nope";
    ASSERT_TRUE(client.Send(R"({"command":")" + std::string(command) + R"(","request_id":)" +
                            std::to_string(i) + "}"));
  }
  for (int i = 0; i < kRequests; ++i) EXPECT_EQ(client.Receive()["request_id"].asInt(), i);
}

TEST_F(ConnectionsTest, ManyClientsGetTheirOwnReplies) {
  constexpr int kClients = 40;
  constexpr int kRounds = 10;
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  threads.reserve(kClients);
  for (int c = 0; c < kClients; ++c) {
    threads.emplace_back([&, c] {
      DaemonClient client = Connect();
      for (int round = 0; round < kRounds; ++round) {
        const std::string id = std::to_string(c * kRounds + round);
        const std::string request =
            round % 2 == 0 ? R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":")" + id +
                                 R"("}],"commit":false},"request_id":")" + id + "\"}"
                           : R"({"command":"terms","data":{"id":"books"},"request_id":")" + id + "\"}";
        for (const JsonValue& reply : client.Exchange(request)) {
          if (reply["request_id"].asString() != id || reply.isMember("error")) ++wrong;
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(wrong, 0);
  DaemonClient client = Connect();
  EXPECT_EQ(client.AskForError(R"({"command":"commit","data":{"id":"books"}})"), "");
  EXPECT_EQ(CountBooks(client), kClients * kRounds / 2);
}

TEST_F(ConnectionsTest, ReadersThatStopHoldUpNobodyAndTakeNoMemory) {
  AddManyWords();
  DaemonClient client = Connect();
  client.Exchange(kAllTerms);
  const size_t before = Resident();
  std::vector<std::unique_ptr<DaemonClient>> stuck;
  for (int i = 0; i < 20; ++i) {  // more than the daemon has threads
    stuck.push_back(std::make_unique<DaemonClient>(daemon_.socket()));
    ASSERT_TRUE(stuck.back()->Send(kAllTerms));
    stuck.back()->Receive();
  }
  EXPECT_EQ(client.Exchange(kAllTerms).back()["result"]["count"].asInt(), kManyWords + 1);
  EXPECT_EQ(
      client.AskForError(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"2"}]}})"),
      "");
  if (!kIsSanitized) {
    EXPECT_LT(Resident(), before + (size_t{64} << 20));
  }
  stuck.front()->ReceiveFinal();  // one of them comes back
}

TEST_F(ConnectionsTest, AClientThatVanishesMidwayIsForgotten) {
  AddManyWords();
  for (int i = 0; i < 10; ++i) {
    DaemonClient client = Connect();
    ASSERT_TRUE(client.Send(kAllTerms));
    client.Receive();
  }
  DaemonClient client = Connect();
  const auto give_up = steady_clock::now() + std::chrono::seconds(10);
  while (client.Ask(R"({"command":"status"})")["result"]["connections"].asInt() > 1) {
    ASSERT_LT(steady_clock::now(), give_up);
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  EXPECT_EQ(client.AskForError(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"), "");
}

TEST_F(ConnectionsTest, AMessageMayTrickleIn) {
  DaemonClient client = Connect();
  const std::string request = R"({"command":"status"})";
  const auto header = quordaemon::EncodeHeader(static_cast<uint32_t>(request.size()));
  const std::string bytes = std::string(header.begin(), header.end()) + request;
  for (const char byte : bytes) {
    ASSERT_EQ(send(client.descriptor(), &byte, 1, MSG_NOSIGNAL), 1);
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  EXPECT_TRUE(client.Receive()["success"].asBool());
}

TEST_F(ConnectionsTest, AClientThatHasSaidAllIsStillAnswered) {
  DaemonClient client = Connect();
  ASSERT_TRUE(client.Send(R"({"command":"status"})"));
  ASSERT_EQ(shutdown(client.descriptor(), SHUT_WR), 0);
  EXPECT_TRUE(client.Receive()["success"].asBool());
  EXPECT_TRUE(client.IsHungUp());
}

class ShortTimeoutsTest : public ConnectionsTest {
 protected:
  ShortTimeoutsTest() : ConnectionsTest({"--idle-timeout", "1", "--stall-timeout", "1"}) {}
};

TEST_F(ShortTimeoutsTest, AnIdleClientIsHungUpOn) {
  DaemonClient client = Connect();
  const auto start = steady_clock::now();
  EXPECT_TRUE(client.IsHungUp());
  EXPECT_GT(steady_clock::now() - start, std::chrono::milliseconds(800));
}

TEST_F(ShortTimeoutsTest, AClientThatStopsWithinAMessageIsHungUpOn) {
  DaemonClient client = Connect();
  ASSERT_EQ(send(client.descriptor(), "\0\0\0\x10{", 5, MSG_NOSIGNAL), 5);
  EXPECT_TRUE(client.IsHungUp());
}

TEST_F(ShortTimeoutsTest, AClientThatSendsAMessageByteByByteIsHungUpOn) {
  for (const std::string& start : {std::string(), std::string("\0\0\x10\0{", 5)}) {
    DaemonClient client = Connect();
    ASSERT_EQ(send(client.descriptor(), start.data(), start.size(), MSG_NOSIGNAL),
              static_cast<ssize_t>(start.size()));
    // Never a stop of a second. Of a header, which is all zeros here, only three bytes can be late.
    const auto pause = std::chrono::milliseconds(start.empty() ? 700 : 100);
    const auto give_up = steady_clock::now() + std::chrono::seconds(60);
    bool is_hung_up = false;
    while (!is_hung_up && steady_clock::now() < give_up) {
      is_hung_up = send(client.descriptor(), "\0", 1, MSG_NOSIGNAL) != 1;
      if (!is_hung_up) std::this_thread::sleep_for(pause);
    }
    EXPECT_TRUE(is_hung_up) << "sent before: " << start.size();
  }
}

TEST_F(ShortTimeoutsTest, AClientThatStopsReadingIsHungUpOn) {
  AddManyWords();
  DaemonClient client = Connect();
  ASSERT_TRUE(client.Send(kAllTerms));
  std::this_thread::sleep_for(std::chrono::milliseconds(2500));
  std::string text;
  bool is_final = false;
  while (client.Recv(text)) is_final = is_final || text.find("\"success\"") != std::string::npos;
  EXPECT_FALSE(is_final);
}

TEST_F(ShortTimeoutsTest, AClientThatReadsSlowlyIsServedToTheEnd) {
  AddManyWords();
  DaemonClient client = Connect();
  ASSERT_TRUE(client.Send(kAllTerms));
  JsonValue reply;
  int replies = 0;
  do {
    reply = client.Receive();
    if (++replies % 50 == 0) std::this_thread::sleep_for(std::chrono::milliseconds(500));
  } while (!reply.isMember("success"));
  EXPECT_EQ(reply["result"]["count"].asInt(), kManyWords + 1);
}

class TwoSecondStallTest : public ConnectionsTest {
 protected:
  TwoSecondStallTest() : ConnectionsTest({"--stall-timeout", "2"}) {}
};

TEST_F(TwoSecondStallTest, AClientThatReadsAMessageInDribletsIsHungUpOn) {
  constexpr size_t kReply = size_t{2} << 20;
  std::string words;
  while (words.size() < kReply) words += "word ";
  DaemonClient client = Connect();
  ASSERT_EQ(client.AskForError(
                R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1","title":")" +
                words + "\"}]}}"),
            "");
  ASSERT_TRUE(
      client.Send(R"({"command":"search","data":{"indice":["books"],"query_string":{"query":"word"}}})"));
  const auto begin = steady_clock::now();
  size_t read = 0;
  std::string droplet(16384, '\0');
  while (read < kReply) {
    const ssize_t got = recv(client.descriptor(), droplet.data(), droplet.size(), 0);
    if (got <= 0) break;
    read += static_cast<size_t>(got);
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
  }
  EXPECT_GT(steady_clock::now() - begin, std::chrono::milliseconds(2500));  // so it did not stop
  EXPECT_LT(read, kReply);  // which would have taken more than six seconds
}

class FewConnectionsTest : public ConnectionsTest {
 protected:
  FewConnectionsTest() : ConnectionsTest({"--max-connections", "2"}) {}
};

TEST_F(FewConnectionsTest, OneTooManyIsToldSoAndHungUpOn) {
  DaemonClient first = Connect();
  ASSERT_EQ(first.AskForError(R"({"command":"status"})"), "");
  auto second = std::make_unique<DaemonClient>(daemon_.socket());
  while (
      !second->AskForError(R"({"command":"status"})").empty()) {  // the index's maker is still being seen off
    second = std::make_unique<DaemonClient>(daemon_.socket());
  }
  DaemonClient third = Connect();
  ASSERT_TRUE(third.Send(R"({"command":"status"})"));
  const JsonValue reply = third.Receive();
  EXPECT_EQ(reply["error"]["code"].asString(), "limit_exceeded");
  EXPECT_EQ(reply["error"]["limit"].asString(), "connections");
  EXPECT_EQ(reply["error"]["most"].asInt(), 2);
  EXPECT_TRUE(third.IsHungUp());
  EXPECT_EQ(first.AskForError(R"({"command":"status"})"), "");
}

class OneThreadTest : public ConnectionsTest {
 protected:
  OneThreadTest() : ConnectionsTest({"--threads", "1"}) {}
};

TEST_F(OneThreadTest, ServesManyAtOnce) {
  AddManyWords();
  DaemonClient stuck = Connect();
  ASSERT_TRUE(stuck.Send(kAllTerms));
  DaemonClient client = Connect();
  EXPECT_EQ(client.Exchange(kAllTerms).back()["result"]["count"].asInt(), kManyWords + 1);
}

}  // namespace
}  // namespace quorelastic::testing
