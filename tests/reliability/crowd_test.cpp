// Many clients at once, each doing everything.

#include <gmock/gmock.h>

#include <chrono>
#include <deque>
#include <latch>
#include <string>
#include <thread>
#include <vector>

#include "crowd_client.h"
#include "daemon_process.h"
#include "index_checkers.h"
#include "support/run_size.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

using std::chrono::steady_clock;
using ::testing::IsEmpty;

class ReliabilityCrowd : public ::testing::Test {
 protected:
  ReliabilityCrowd() : daemon_(folder_.path()) {
    EXPECT_TRUE(daemon_.is_ready()) << daemon_.Log();
    EXPECT_EQ(Connect().AskForError(R"({"command":"index_create","data":{"id":"crowd","settings":{"fields":[)"
                                    R"({"name":"owner","type":"keyword"},{"name":"text","type":"text"}]}}})"),
              "");
  }

  DaemonClient Connect() { return DaemonClient(daemon_.socket()); }

  void RunAtOnce(std::deque<CrowdClient>& clients, int requests) {
    std::latch start(static_cast<std::ptrdiff_t>(clients.size()));
    std::vector<std::thread> threads;
    threads.reserve(clients.size());
    for (CrowdClient& client : clients) {
      threads.emplace_back([&] {
        start.arrive_and_wait();
        client.Run(requests);
      });
    }
    for (std::thread& thread : threads) thread.join();
  }

  // The documents that a client should find are those that it left.
  static void ExpectDocuments(DaemonClient& asking, const CrowdClient& client) {
    const JsonValue reply =
        asking.Ask(R"({"command":"search","data":{"indice":["crowd"],"query_string":{"query":"owner:)" +
                   client.owner() + R"("},"size":1000}})");
    std::set<std::string> found;
    for (const Json::Value& hit : reply["result"]["hits"]) found.insert(hit["id"].asString());
    EXPECT_EQ(found, client.documents()) << client.owner();
    EXPECT_EQ(reply["result"]["total"].asUInt64(), client.documents().size()) << client.owner();
  }

  TemporaryFolder folder_;
  DaemonProcess daemon_;
};

TEST_F(ReliabilityCrowd, EveryRequestOfEveryClientGetsItsOwnReply) {
  const int count = RunSize("QUORELASTIC_CLIENTS", 16);
  const int requests = RunSize("QUORELASTIC_REQUESTS", 20);
  const uint32_t seed = RunSeed();
  std::deque<CrowdClient> clients;
  for (int i = 0; i < count; ++i) clients.emplace_back(daemon_.socket(), i, seed + static_cast<uint32_t>(i));
  const auto start = steady_clock::now();
  RunAtOnce(clients, requests);
  const std::chrono::duration<double> took = steady_clock::now() - start;
  for (const CrowdClient& client : clients) EXPECT_THAT(client.problems(), IsEmpty());

  DaemonClient client = Connect();
  const int seen = client.Ask(R"({"command":"status"})")["result"]["requests"].asInt();
  EXPECT_EQ(seen, count * requests + 2);  // and the index's making, and this one
  EXPECT_EQ(client.AskForError(R"({"command":"commit","data":{"id":"crowd"}})"), "");
  for (const CrowdClient& one : clients) ExpectDocuments(client, one);
  EXPECT_EQ(daemon_.Stop(), 0) << daemon_.Log();  // a sanitizer's report would end it otherwise
  ExpectCleanIndex(folder_ / "data/crowd");
  Tell("crowd", std::to_string(count) + " clients at once, " + std::to_string(count * requests) +
                    " requests in " + std::to_string(took.count()) + " s");
}

}  // namespace
}  // namespace quorelastic::testing
