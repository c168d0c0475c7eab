// A daemon whose disk fills up, again and again, and is given room again.

#include <gmock/gmock.h>

#include <optional>
#include <random>
#include <set>
#include <string>

#include "daemon_client.h"
#include "index_checkers.h"
#include "small_disk_daemon.h"
#include "support/run_size.h"
#include "support/sandbox_test.h"

namespace quorelastic::testing {
namespace {

constexpr uint64_t kMebibyte = uint64_t{1} << 20;
constexpr uint64_t kDiskBytes = 16 * kMebibyte;

class ReliabilityFullDisk : public SandboxTest {
 protected:
  void SetUp() override {
    SandboxTest::SetUp();
    if (IsSkipped()) return;
    daemon_.emplace(kDiskBytes);
    client_.emplace(daemon_->socket());
  }

  SmallDiskDaemon& daemon() { return *daemon_; }
  std::string ErrorOf(const std::string& request) { return client_->AskForError(request); }
  int Pick(int least, int most) { return std::uniform_int_distribution<int>(least, most)(random_); }

  std::string Create(const std::string& index) {
    return ErrorOf(R"({"command":"index_create","data":{"id":")" + index +
                   R"(","settings":{"fields":[{"name":"text","type":"text"}]}}})");
  }

  std::string Remove(const std::string& index) {
    return ErrorOf(R"({"command":"index_delete","data":{"id":")" + index + R"(","confirm":")" + index +
                   "\"}}");
  }

  static std::string OfBooks(const std::string& command) {
    return R"({"command":")" + command + R"(","data":{"id":"books"}})";
  }

  // Loads so many new documents of about a kilobyte: the error, "" where they were committed.
  std::string Load(const std::string& index, int count, bool commit = true) {
    JsonValue request(Json::objectValue);
    request["command"] = "document_bulk";
    request["data"]["id"] = index;
    request["data"]["commit"] = commit;
    std::set<std::string> ids;
    for (int i = 0; i < count; ++i) {
      Json::Value& document = request["data"]["documents"].append(Json::objectValue);
      const std::string id = std::to_string(++last_id_);
      document["id"] = id;
      std::string text;
      for (int word = 0; word < 100; ++word) text.append(std::to_string(Pick(0, 1 << 30))).append(" ");
      document["text"] = text;
      ids.insert(id);
    }
    const JsonValue reply = client_->Ask(request.toString());
    if (!reply["success"].asBool()) {
      EXPECT_EQ(reply["error"]["committed"], false) << reply.toString();
      return reply["error"]["code"].asString();
    }
    EXPECT_EQ(reply["result"]["committed"].asBool(), commit);
    if (index == "books" && commit) books_.insert(ids.begin(), ids.end());
    return "";
  }

  std::string DeleteSome() {
    const std::string id = *books_.begin();
    const std::string error =
        ErrorOf(R"({"command":"document_delete","data":{"id":"books","ids":[")" + id + "\"]}}");
    if (error.empty()) books_.erase(id);
    return error;
  }

  // What is served is what was committed.
  void ExpectServed() {
    const JsonValue reply = client_->Ask(
        R"({"command":"search","data":{"indice":["books"],"query_string":{"query":"*:*"},"size":10000,)"
        R"("load_field":["id"]}})");
    std::set<std::string> found;
    for (const Json::Value& hit : reply["result"]["hits"]) found.insert(hit["id"].asString());
    EXPECT_EQ(found, books_) << reply["error"].toStyledString();
    EXPECT_EQ(reply["result"]["total"].asUInt64(), books_.size());
    EXPECT_EQ(ErrorOf(OfBooks("terms")), "");
    EXPECT_EQ(ErrorOf(OfBooks("index_list")), "");
    EXPECT_EQ(ErrorOf(R"({"command":"status"})"), "");
  }

  // Loads until an error comes, which is handed back.
  std::string FillDisk() {
    for (int i = 0; i < 1000; ++i) {
      std::string error = Load("books", Pick(1, 400));
      if (error.empty() && Pick(0, 3) == 0) error = DeleteSome();
      if (!error.empty()) return error;
    }
    return "the disk does not fill up";
  }

  // Nothing can be written, and all who try are told so.
  void ExpectNothingWritable() {
    EXPECT_EQ(Load("books", 10), "io_error");
    EXPECT_EQ(DeleteSome(), "io_error");
    EXPECT_EQ(Create("new"), "io_error");
    ExpectServed();
  }

  std::mt19937 random_;
  std::set<std::string> books_;  // the ids of what was committed

 private:
  std::optional<SmallDiskDaemon> daemon_;
  std::optional<DaemonClient> client_;
  int last_id_ = 0;
};

TEST_F(ReliabilityFullDisk, WritersAreToldAndEverythingElseGoesOn) {
  const int rounds = RunSize("QUORELASTIC_FULL_DISKS", 2);
  random_.seed(RunSeed());
  const uint64_t free_at_first = daemon().FreeBytes();
  size_t most = 0;
  for (int round = 0; round < rounds && !HasFailure(); ++round) {
    SCOPED_TRACE("round " + std::to_string(round));
    books_.clear();
    ASSERT_EQ(Create("books"), "");
    ASSERT_EQ(Create("other"), "");
    ASSERT_EQ(Load("books", 10), "");
    // What makes room in the end is at least twice what is written, which is written as files first and then once
    // more as one.
    const bool is_file = round % 2 == 0;
    for (int i = 0; i < (is_file ? 1 : 4); ++i) ASSERT_EQ(Load("other", is_file ? 100 : 1000), "");
    daemon().WriteBallast("ballast", (is_file ? 11 : 0) * kMebibyte);
    EXPECT_EQ(FillDisk(), "io_error");
    ExpectServed();
    daemon().WriteBallast("rest", kDiskBytes);
    ExpectNothingWritable();

    daemon().RemoveBallast("rest");
    if (is_file) {
      daemon().RemoveBallast("ballast");
    } else {
      EXPECT_EQ(Remove("other"), "");
    }
    EXPECT_EQ(Load("books", 50), "") << daemon().Log();
    EXPECT_EQ(DeleteSome(), "");
    ExpectServed();
    ExpectCleanIndex(daemon().data() + "/books");
    most = std::max(most, books_.size());

    if (is_file) {
      EXPECT_EQ(Remove("other"), "");
    } else {
      daemon().RemoveBallast("ballast");
    }
    EXPECT_EQ(Remove("books"), "");
    EXPECT_GE(daemon().FreeBytes() + kMebibyte / 16, free_at_first);
  }
  EXPECT_EQ(daemon().Stop(), 0) << daemon().Log();
  Tell("full disk", std::to_string(rounds) + " times full, with up to " + std::to_string(most) +
                        " documents on " + std::to_string(kDiskBytes / kMebibyte) + " MiB");
}

TEST_F(ReliabilityFullDisk, WhatAnOptimizeLosesIsToldOnceAndOnlyToWhoAsksForACommit) {
  ASSERT_EQ(Create("books"), "");
  ASSERT_EQ(Load("books", 100), "");
  ASSERT_EQ(Load("books", 100), "");
  daemon().WriteBallast("rest", kDiskBytes);
  ASSERT_EQ(Load("books", 10, false), "");
  EXPECT_EQ(ErrorOf(OfBooks("optimize")), "io_error");
  ExpectServed();
  daemon().RemoveBallast("rest");
  EXPECT_EQ(Load("books", 10), "");
  ExpectServed();
  EXPECT_EQ(ErrorOf(OfBooks("commit")), "io_error");  // ten documents were promised to become durable by it
  EXPECT_EQ(ErrorOf(OfBooks("commit")), "");
  EXPECT_EQ(ErrorOf(OfBooks("optimize")), "");
  ExpectServed();
  ExpectCleanIndex(daemon().data() + "/books");
}

}  // namespace
}  // namespace quorelastic::testing
