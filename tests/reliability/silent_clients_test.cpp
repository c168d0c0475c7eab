// Many clients that ask for much and never read, while others go on.

#include <gmock/gmock.h>
#include <sys/socket.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <deque>
#include <fstream>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "daemon_client.h"
#include "daemon_process.h"
#include "quordaemon/wire.h"
#include "support/run_size.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;
using std::chrono::steady_clock;

constexpr size_t kMebibyte = size_t{1} << 20;

// No figure to be proud of: it tells being served from being held up.
constexpr seconds kServed{kIsSanitized ? 15 : 5};

constexpr const char* kAllTerms = R"({"command":"terms","data":{"id":"big","max":1000000}})";
constexpr const char* kLargeSearch =
    R"({"command":"search","data":{"indice":["big"],"query_string":{"query":"*:*"},"size":1000}})";

class ReliabilitySilentClients : public ::testing::Test {
 protected:
  explicit ReliabilitySilentClients(const std::vector<std::string>& arguments = {"--stall-timeout", "300"})
      : daemon_(folder_.path(), arguments) {
    EXPECT_TRUE(daemon_.is_ready()) << daemon_.Log();
    FillIndex();
  }

  DaemonClient Connect() { return DaemonClient(daemon_.socket()); }

  // A thousand documents of a thousand bytes, and a hundred thousand words.
  void FillIndex() {
    DaemonClient client = Connect();
    EXPECT_EQ(client.AskForError(R"({"command":"index_create","data":{"id":"big","settings":{"fields":[)"
                                 R"({"name":"text","type":"text"}]}}})"),
              "");
    JsonValue request(Json::objectValue);
    request["command"] = "document_bulk";
    request["data"]["id"] = "big";
    for (int i = 0; i < 1000; ++i) {
      Json::Value& document = request["data"]["documents"].append(Json::objectValue);
      document["id"] = std::to_string(i);
      std::string text;
      for (int word = 0; word < 100; ++word)
        text.append("word").append(std::to_string(i * 100 + word)).append(" ");
      document["text"] = text;
    }
    EXPECT_EQ(client.AskForError(request.toString()), "");
  }

  // Connects so many clients that never read: some ask for all terms, some for a large page of hits, and all of
  // them send further requests as long as anybody takes them.
  void AddSilentClients(int count) {
    for (int i = 0; i < count; ++i) {
      silent_.push_back(std::make_unique<DaemonClient>(daemon_.socket()));
      ASSERT_TRUE(silent_.back()->Send(i % 2 == 0 ? kAllTerms : kLargeSearch));
      SendWithoutEnd(*silent_.back());
    }
  }

  // Takes the daemon to the memory that it needs for as many large replies as it makes at a time.
  void AnswerAtOnce(int count) {
    std::deque<DaemonClient> clients;
    for (int i = 0; i < count; ++i) {
      clients.emplace_back(daemon_.socket());
      ASSERT_TRUE(clients.back().Send(i % 2 == 0 ? kAllTerms : kLargeSearch));
    }
    for (DaemonClient& client : clients) client.ReceiveFinal();
  }

  // Bytes of memory that the daemon holds.
  size_t Resident() const {
    std::ifstream file("/proc/" + std::to_string(daemon_.pid()) + "/statm");
    size_t all = 0;
    size_t resident = 0;
    file >> all >> resident;
    return resident * 4096;
  }

  // Asks for something of everything, and hands back how long the slowest answer took.
  milliseconds ServeOnce(DaemonClient& client) {
    milliseconds longest(0);
    for (const std::string request :
         {R"({"command":"terms","data":{"id":"big","max":3000}})",
          R"({"command":"search","data":{"indice":["big"],"query_string":{"query":"text:word7*"}}})",
          R"({"command":"status"})",
          R"({"command":"document_bulk","data":{"id":"big","documents":[{"id":"0","text":"word0"}]}})"}) {
      const auto start = steady_clock::now();
      EXPECT_EQ(client.AskForError(request), "") << request;
      longest = std::max(longest, std::chrono::duration_cast<milliseconds>(steady_clock::now() - start));
    }
    return longest;
  }

  TemporaryFolder folder_;
  DaemonProcess daemon_;
  std::vector<std::unique_ptr<DaemonClient>> silent_;

 private:
  // Until the socket is full.
  static void SendWithoutEnd(const DaemonClient& client) {
    const std::string request(kAllTerms);
    const auto header = quordaemon::EncodeHeader(static_cast<uint32_t>(request.size()));
    const std::string message = std::string(header.begin(), header.end()) + request;
    const auto length = static_cast<ssize_t>(message.size());
    while (send(client.descriptor(), message.data(), message.size(), MSG_NOSIGNAL | MSG_DONTWAIT) == length) {
    }
  }
};

TEST_F(ReliabilitySilentClients, TheyHoldUpNobodyAndTakeLittleMemory) {
  const int count = RunSize("QUORELASTIC_SILENT_CLIENTS", 50);
  const milliseconds duration(RunSize("QUORELASTIC_SILENT_MILLISECONDS", 1000));
  constexpr int kServing = 4;
  std::deque<DaemonClient> clients;
  for (int i = 0; i < kServing; ++i) clients.emplace_back(daemon_.socket());
  for (DaemonClient& client : clients) ServeOnce(client);
  AnswerAtOnce(20);
  const size_t before = Resident();
  ASSERT_NO_FATAL_FAILURE(AddSilentClients(count));

  std::vector<milliseconds> longest(kServing);
  std::atomic<int> served{0};
  std::atomic<size_t> most{0};
  std::vector<std::thread> threads;
  const auto end = steady_clock::now() + duration;
  for (size_t i = 0; i < kServing; ++i) {
    threads.emplace_back([&, i] {
      do {
        longest[i] = std::max(longest[i], ServeOnce(clients[i]));
        ++served;
        if (i == 0) most = std::max(most.load(), Resident());
      } while (steady_clock::now() < end);
    });
  }
  for (std::thread& thread : threads) thread.join();
  const milliseconds slowest = *std::max_element(longest.begin(), longest.end());
  EXPECT_LT(slowest, kServed);
  const size_t growth = most - std::min(before, most.load());
  if (!kIsSanitized) {
    EXPECT_LT(growth, 64 * kMebibyte);
  }
  Tell("silent clients", std::to_string(count) + " that never read; " + std::to_string(4 * served) +
                             " requests of others served, the slowest in " + std::to_string(slowest.count()) +
                             " ms; the daemon grew by " + std::to_string(growth / kMebibyte) + " MiB");
}

class ReliabilityTimeouts : public ReliabilitySilentClients {
 protected:
  ReliabilityTimeouts() : ReliabilitySilentClients({"--idle-timeout", "1", "--stall-timeout", "1"}) {}
};

TEST_F(ReliabilityTimeouts, AllThatAreSilentAreEndedAndNobodyElse) {
  const int count = RunSize("QUORELASTIC_SILENT_CLIENTS", 50);
  DaemonClient busy = Connect();
  std::deque<DaemonClient> idle;
  for (int i = 0; i < count; ++i) {
    idle.emplace_back(daemon_.socket());
    if (i % 2 == 0) idle.back().Ask(R"({"command":"status"})");  // some have asked before
  }
  ASSERT_NO_FATAL_FAILURE(AddSilentClients(count));
  const auto start = steady_clock::now();
  int connections = 0;
  do {
    std::this_thread::sleep_for(milliseconds(100));
    connections = busy.Ask(R"({"command":"status"})")["result"]["connections"].asInt();
  } while (connections > 1 && steady_clock::now() - start < seconds(30));
  EXPECT_EQ(connections, 1);
  const auto took = std::chrono::duration_cast<milliseconds>(steady_clock::now() - start);
  EXPECT_GT(took, milliseconds(800));
  for (DaemonClient& client : idle) EXPECT_TRUE(client.IsHungUp());
  for (const auto& client : silent_) {
    // What was on its way can still be read, but not all.
    std::string text;
    int replies = 0;
    while (client->Recv(text)) ++replies;
    EXPECT_LT(replies, 100);
  }
  EXPECT_LT(ServeOnce(busy), kServed);
  Tell("timeouts", std::to_string(2 * count) + " idle and stalled clients ended after " +
                       std::to_string(took.count()) + " ms, with timeouts of 1 s");
}

}  // namespace
}  // namespace quorelastic::testing
