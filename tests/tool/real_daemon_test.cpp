// The actions that talk to the daemon, with the real one: both as they are installed, at their fixed places.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/json.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "support/files.h"
#include "support/sandbox_test.h"
#include "support/tool_run.h"
#include "tool/inspection.h"
#include "tool/outcome.h"
#include "tool/sandboxed_daemon.h"

namespace quorelastic::testing {
namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::StartsWith;

constexpr const char* kCreateBooks =
    R"({"command":"index_create","data":{"id":"books","settings":{"fields":[)"
    R"({"name":"title","type":"text","term_vector":"positions"},{"name":"author","type":"keyword"}]}}})";
constexpr const char* kAddBooks = R"({"command":"document_bulk","data":{"id":"books","documents":[)"
                                  R"({"id":"1","title":"The Old Man and the Sea","author":"Hemingway"},)"
                                  R"({"id":"2","title":"Old Goriot","author":"Balzac"}]}})";

class RealDaemonTest : public SandboxTest {
 protected:
  void SetUp() override {
    SandboxTest::SetUp();
    if (IsSkipped()) return;
    daemon_.emplace(sandbox_, QUORELASTICD_PROGRAM);
  }

  // The last line of what the tool printed of an exchange, which has to go well as such.
  Json::Value LastReply(const std::vector<std::string>& arguments, const RunOptions& options = {}) const {
    const RunResult run = sandbox_.RunTool(arguments, options);
    EXPECT_EQ(run.status, 0) << run;
    EXPECT_EQ(run.err, "");
    const std::vector<std::string> lines = LinesWithEnds(run.out);
    Json::Value reply;
    if (lines.empty()) {
      ADD_FAILURE() << "no reply";
      return reply;
    }
    std::string complaint;
    const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
    const std::string& last = lines.back();
    EXPECT_TRUE(reader->parse(last.data(), last.data() + last.size(), &reply, &complaint)) << complaint;
    return reply;
  }

  Json::Value Command(const std::string& request) const {
    return LastReply({"--action", "command", "--string", request});
  }

  static std::string Failure(const Json::Value& reply) {
    EXPECT_FALSE(reply["success"].asBool());
    return reply["error"]["code"].asString() + ": " + reply["error"]["reason"].asString();
  }

  void MakeBooks() const {
    ASSERT_TRUE(Command(kCreateBooks)["success"].asBool());
    ASSERT_TRUE(Command(kAddBooks)["success"].asBool());
  }

  Json::Value Search(const std::vector<std::string>& options) const {
    std::vector<std::string> arguments{"--action", "search", "--Index", "books"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    return LastReply(arguments);
  }

  static constexpr const char* kBooksFolder = "/var/lib/quorelastic/books";

  Sandbox sandbox_;
  std::optional<SandboxedDaemon> daemon_;
};

TEST_F(RealDaemonTest, TakesRequestsFromFilesStandardInputAndTheCommandLine) {
  const std::string path = sandbox_.folder() + "/create.json";
  WriteFile(path, kCreateBooks);
  EXPECT_TRUE(LastReply({"--action", "command", "--path", path})["success"].asBool());
  const Json::Value added = LastReply({"--action", "command", "--string", "-"},
                                      {.input = std::string(kAddBooks).insert(17, "\n\n") + "\n"});
  EXPECT_EQ(added["result"]["indexed"].asInt(), 2);
  EXPECT_TRUE(added["result"]["committed"].asBool());
  EXPECT_EQ(Command(R"({"command":"status","request_id":"x"})")["request_id"], "x");
}

TEST_F(RealDaemonTest, FindsWhatWasAdded) {
  MakeBooks();
  const Json::Value reply = Search({"--query", "old"});
  EXPECT_EQ(reply["result"]["total"].asInt(), 2);
  EXPECT_EQ(reply["result"]["hits"][0]["id"], "2");
  EXPECT_EQ(Search({"--query", "old", "--size", "1", "--offset", "1"})["result"]["hits"][0]["id"], "1");
  EXPECT_EQ(Search({"--query", "old", "--size", "0"})["result"]["hits"].size(), 0u);
  EXPECT_EQ(Search({"--query", "author:Balzac"})["result"]["total"].asInt(), 1);
}

TEST_F(RealDaemonTest, AppliesPluginsAndLoadsTheFieldsAskedFor) {
  MakeBooks();
  const Json::Value reply =
      Search({"--query", "old", "--Plugin", "term", "--Data", R"({"field":"author","values":["Hemingway"]})",
              "--field", R"(["author"])"});
  ASSERT_EQ(reply["result"]["total"].asInt(), 1);
  EXPECT_EQ(reply["result"]["hits"][0]["fields"].getMemberNames(), std::vector<std::string>{"author"});
  EXPECT_EQ(Search({"--query", "old", "--Data", R"({"a":1})"})["result"]["total"].asInt(), 2);
  EXPECT_EQ(Search({"--query", "old", "--field", "author"})["result"]["hits"][0]["fields"].size(), 3u);
}

TEST_F(RealDaemonTest, ListsTheIndexThatIsDumped) {
  MakeBooks();
  const Json::Value reply = LastReply({"--action", "dump", "--Index", "books"});
  ASSERT_EQ(reply["result"]["indexes"].size(), 1u);
  EXPECT_EQ(reply["result"]["indexes"][0]["documents"].asInt(), 2);
  EXPECT_THAT(Failure(LastReply({"--action", "dump", "--Index", "films"})), StartsWith("index_not_found: "));
}

TEST_F(RealDaemonTest, AnswersMistakesAndIsThereForTheNext) {
  MakeBooks();
  EXPECT_THAT(Failure(Command("no json")), StartsWith("bad_request: the request is no JSON document"));
  EXPECT_THAT(Failure(Command("5")), StartsWith("bad_request: the request: expected an object"));
  EXPECT_THAT(Failure(Command(std::string(100'000, '['))), StartsWith("limit_exceeded: json_depth"));
  EXPECT_THAT(Failure(Command("{\"command\":\"st\xff\"}")),
              StartsWith("bad_request: the request is no valid UTF-8"));
  EXPECT_THAT(Failure(Search({"--query", "old AND"})), StartsWith("query_syntax: "));
  EXPECT_THAT(Failure(Search({"--query", "old", "--size", "20000"})), StartsWith("limit_exceeded: "));
  EXPECT_THAT(Failure(Search({"--query", "old", "--Plugin", "nearby"})), StartsWith("unknown_plugin: "));
  EXPECT_THAT(Failure(Search({"--query", "old", "--Plugin", "ids"})),
              AllOf(StartsWith("bad_request: "), HasSubstr("values")));
  EXPECT_THAT(Failure(Search({"--query", std::string(100, '(') + "old" + std::string(100, ')')})),
              AllOf(StartsWith("limit_exceeded: "), HasSubstr("query_depth")));
  EXPECT_THAT(Failure(Search({"--query", "old", "--Data", "[1]", "--Plugin", "range"})),
              StartsWith("bad_request: "));
  EXPECT_EQ(Search({"--query", "old"})["result"]["total"].asInt(), 2);
}

TEST_F(RealDaemonTest, StreamsTheProgressOfALoad) {
  ASSERT_TRUE(Command(kCreateBooks)["success"].asBool());
  std::string lines;
  for (int i = 0; i < 5000; ++i) lines += R"({"id":")" + std::to_string(i) + "\",\"title\":\"old\"}\n";
  WriteFile(sandbox_.data_root() + "/import/books.ndjson", lines);
  const RunResult run =
      sandbox_.RunTool({"--action", "command", "--string",
                        R"({"command":"document_bulk","data":{"id":"books","file":"books.ndjson"}})"});
  const std::vector<std::string> replies = LinesWithEnds(run.out);
  ASSERT_GE(replies.size(), 6u);
  for (size_t i = 0; i + 1 < replies.size(); ++i) {
    EXPECT_THAT(replies[i], AllOf(HasSubstr("\"progress\""), ::testing::Not(HasSubstr("\"success\""))));
  }
  EXPECT_THAT(replies.back(), HasSubstr("\"indexed\":5000"));
  EXPECT_EQ(Search({"--query", "old"})["result"]["total"].asInt(), 5000);
}

TEST_F(RealDaemonTest, LeavesAnIndexThatTheOtherActionsRead) {
  MakeBooks();
  EXPECT_THAT(
      sandbox_.RunTool({"--action", "position", "--db", kBooksFolder, "--field", "title", "--token", "old"}),
      Printed("pos: 1\ndoc: 0 freq: 1\n"));
  EXPECT_THAT(
      sandbox_.RunTool({"--action", "doc_term", "--db", kBooksFolder, "--field", "title", "--ndoc", "1"}),
      Printed("title: goriot\ntitle: old\n"));
  EXPECT_THAT(sandbox_.RunTool({"--action", "term", "--db", kBooksFolder, "--info", "--field", "author"}),
              Printed(HasSubstr("field: author text: Balzac\nfield: author text: Hemingway\n")));
}

TEST_F(RealDaemonTest, EndsOnASignalAndIsGone) {
  MakeBooks();
  Command(
      R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"3","title":"x"}],"commit":false}})");
  EXPECT_EQ(daemon_->Stop(), 0);
  EXPECT_THAT(sandbox_.RunTool({"--action", "dump", "--Index", "books"}),
              Ended(0, "", "Connect to daemon fail\n"));
  EXPECT_THAT(sandbox_.RunTool({"--action", "term", "--db", kBooksFolder, "--info", "--field", "title"}).out,
              HasSubstr("field: title text: x\n"));
}

}  // namespace
}  // namespace quorelastic::testing
