// A daemon that is killed at random moments while clients write, over and over on the same data folder.

#include <gmock/gmock.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <deque>
#include <map>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "daemon_client.h"
#include "daemon_process.h"
#include "document_model.h"
#include "index_checkers.h"
#include "support/run_size.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

using ::testing::IsEmpty;
using Random = std::mt19937;

// A search reaches no further, and the checks look at all documents.
constexpr int kMostIds = 9500;

int Pick(Random& random, int least, int most) {
  return std::uniform_int_distribution<int>(least, most)(random);
}

// The text of a version: what is found shows whether it is wholly that version.
std::string TextOf(uint64_t version) {
  Random words(static_cast<uint32_t>(version));
  std::string text;
  for (int i = 0; i < 12; ++i) text.append("w").append(std::to_string(Pick(words, 0, 5000))).append(" ");
  return text;
}

JsonValue RequestOfBooks(const char* command) {
  JsonValue request(Json::objectValue);
  request["command"] = command;
  request["data"]["id"] = "books";
  return request;
}

// Writes to the index "books" in random ways until the daemon is gone.
class LoadingClient {
 public:
  LoadingClient(const std::string& socket, DocumentModel& model, int ids, uint32_t seed)
      : client_(socket), model_(model), ids_(ids), random_(seed) {}

  // `expects_the_end` is set before the daemon is killed. What goes wrong before is handed back.
  std::string Run(const std::atomic<bool>& expects_the_end) {
    try {
      for (;;) WriteSomething();
    } catch (const std::exception& error) {
      return expects_the_end ? "" : error.what();
    }
  }

 private:
  void WriteSomething() {
    const int choice = Pick(random_, 0, 99);
    if (choice < 60) return Load(Pick(random_, 1, 60), Pick(random_, 0, 2) == 0);
    if (choice < 64) return Load(1200, Pick(random_, 0, 1) == 0);  // long enough for progress replies
    if (choice < 82) return Delete(Pick(random_, 1, 20), Pick(random_, 0, 2) == 0);
    Finish(RequestOfBooks(choice < 98 ? "commit" : "optimize"), {});
  }

  std::set<std::string> PickIds(int count) {
    std::set<std::string> ids;
    for (int i = 0; i < count; ++i) ids.insert(std::to_string(Pick(random_, 0, ids_ - 1)));
    return ids;
  }

  void Load(int count, bool commit) {
    JsonValue request = RequestOfBooks("document_bulk");
    request["data"]["commit"] = commit;
    std::vector<DocumentModel::Change> changes;
    for (const std::string& id : PickIds(count)) {
      changes.push_back({id, model_.NewVersion()});
      Json::Value& document = request["data"]["documents"].append(Json::objectValue);
      document["id"] = id;
      document["version"] = std::to_string(changes.back().version);
      document["text"] = TextOf(changes.back().version);
    }
    Finish(request, std::move(changes));
  }

  void Delete(int count, bool commit) {
    JsonValue request = RequestOfBooks("document_delete");
    request["data"]["commit"] = commit;
    std::vector<DocumentModel::Change> changes;
    for (const std::string& id : PickIds(count)) {
      changes.push_back({id, 0});
      request["data"]["ids"].append(id);
    }
    Finish(request, std::move(changes));
  }

  void Finish(const JsonValue& request, std::vector<DocumentModel::Change> changes) {
    const DocumentModel::Request begun = model_.Begin(std::move(changes));
    const JsonValue reply = client_.Ask(request.toString());
    if (!reply["success"].asBool()) throw std::runtime_error(reply.toString());
    model_.Acknowledge(begun, reply["result"]["committed"].asBool());
  }

  DaemonClient client_;
  DocumentModel& model_;
  int ids_;
  Random random_;
};

// Makes and removes the index "scratch" until the daemon is gone. The model knows it as a document; it is one of
// its own, because what happens to one index makes nothing of another durable.
std::string MakeAndRemove(DaemonClient& client, DocumentModel& model,
                          const std::atomic<bool>& expects_the_end) {
  try {
    for (;;) {
      auto begun = model.Begin({{"scratch", 1}});
      std::string code = client.AskForError(
          R"({"command":"index_create","data":{"id":"scratch","settings":{"fields":[{"name":"f","type":"text"}]}}})");
      if (code == "index_exists") code.clear();  // it outlived a kill
      if (!code.empty()) return "index_create: " + code;
      model.Acknowledge(begun, true);
      begun = model.Begin({{"scratch", 0}});
      code = client.AskForError(R"({"command":"index_delete","data":{"id":"scratch","confirm":"scratch"}})");
      if (!code.empty()) return "index_delete: " + code;
      model.Acknowledge(begun, true);
    }
  } catch (const std::exception& error) {
    return expects_the_end ? "" : error.what();
  }
}

class ReliabilityKills : public ::testing::Test {
 protected:
  static constexpr int kWriters = 4;

  void CreateIndex() {
    const DaemonProcess daemon(folder_.path());
    ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
    ASSERT_EQ(
        DaemonClient(daemon.socket())
            .AskForError(
                R"({"command":"index_create","data":{"id":"books","settings":{"fields":[)"
                R"({"name":"version","type":"keyword"},{"name":"text","type":"text","term_vector":"positions"}]}}})"),
        "");
  }

  // The documents of the index by what a search finds, an id and a version each.
  static std::map<std::string, uint64_t> FindAll(DaemonClient& client) {
    std::map<std::string, uint64_t> found;
    const JsonValue reply = client.Ask(
        R"({"command":"search","data":{"indice":["books"],"query_string":{"query":"*:*"},"size":10000}})");
    EXPECT_TRUE(reply["success"].asBool()) << reply.toString();
    for (const Json::Value& hit : reply["result"]["hits"]) {
      const uint64_t version = std::stoull(hit["fields"]["version"].asString());
      EXPECT_TRUE(found.emplace(hit["id"].asString(), version).second)
          << hit["id"].asString() << " is there twice";
      EXPECT_EQ(hit["fields"]["text"].asString(), TextOf(version)) << hit["id"].asString();
    }
    EXPECT_EQ(reply["result"]["total"].asUInt64(), found.size());
    return found;
  }

  static std::map<std::string, uint64_t> FindScratch(DaemonClient& client) {
    std::map<std::string, uint64_t> found;
    const JsonValue reply = client.Ask(R"({"command":"index_list"})");
    for (const Json::Value& index : reply["result"]["indexes"]) {
      EXPECT_FALSE(index.isMember("error")) << index.toStyledString();
      if (index["id"] == "scratch") found.emplace("scratch", 1);
    }
    return found;
  }

  // Lets clients write for so long or, where need be, until something has been committed at all, kills the daemon under their hands, and expects that it noticed no error.
  void WriteAndKill(DaemonProcess& daemon, int ids, std::chrono::milliseconds when, bool needs_commit,
                    uint32_t seed) {
    std::atomic<bool> expects_the_end{false};
    std::deque<LoadingClient> writers;
    for (uint32_t i = 0; i < kWriters; ++i) writers.emplace_back(daemon.socket(), model_, ids, seed + i);
    DaemonClient maker(daemon.socket());
    std::vector<std::string> problems(kWriters + 1);
    std::vector<std::thread> threads;
    for (size_t i = 0; i < kWriters; ++i) {
      threads.emplace_back([&, i] { problems[i] = writers[i].Run(expects_the_end); });
    }
    threads.emplace_back([&] { problems[kWriters] = MakeAndRemove(maker, indexes_, expects_the_end); });
    std::this_thread::sleep_for(when);
    const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (needs_commit && !model_.HasCommit() && std::chrono::steady_clock::now() < give_up) {
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    expects_the_end = true;
    daemon.Signal(SIGKILL);
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(daemon.Wait(), -SIGKILL);
    for (const std::string& problem : problems) EXPECT_EQ(problem, "");
  }

  TemporaryFolder folder_;
  DocumentModel model_;
  DocumentModel indexes_;
};

TEST_F(ReliabilityKills, NothingCommittedIsLostAndTheRestartNeedsNoHand) {
  const int rounds = RunSize("QUORELASTIC_KILLS", 8);
  Random random(RunSeed());
  ASSERT_NO_FATAL_FAILURE(CreateIndex());
  size_t documents = 0;
  for (int round = 0; round < rounds && !HasFailure(); ++round) {
    SCOPED_TRACE("round " + std::to_string(round));
    // At times it has hardly begun.
    const std::chrono::milliseconds when(round % 4 == 3 ? Pick(random, 0, 30) : Pick(random, 30, 500));
    const int ids = std::min(kMostIds, 500 + 50 * round);
    {
      DaemonProcess daemon(folder_.path());
      ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
      WriteAndKill(daemon, ids, when, round == 0, static_cast<uint32_t>(random()));
    }
    ExpectCleanIndex(folder_ / "data/books");
    const DaemonProcess daemon(folder_.path());
    ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
    DaemonClient client(daemon.socket());
    const auto found = FindAll(client);
    documents = found.size();
    EXPECT_THAT(model_.Compare(found), IsEmpty());
    EXPECT_THAT(indexes_.Compare(FindScratch(client)), IsEmpty());
    EXPECT_EQ(client.AskForError(R"({"command":"commit","data":{"id":"books"}})"), "");
  }
  EXPECT_GT(model_.committed_versions(), 0U);  // else nothing was tried
  Tell("kills", std::to_string(rounds) + " kills, " + std::to_string(model_.committed_versions()) +
                    " versions of documents acknowledged as committed, " + std::to_string(documents) +
                    " documents in the end");
}

}  // namespace
}  // namespace quorelastic::testing
