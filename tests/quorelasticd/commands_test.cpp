// Every command, asked of a real daemon.

#include <gmock/gmock.h>

#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "served_index.h"
#include "support/files.h"
#include "support/text_search.h"
#include "vantrel/elastic/index.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::_;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

class CommandsTest : public ServedIndex {
 protected:
  JsonValue Ask(const std::string& request) { return client_.Ask(request); }
  std::string Error(const std::string& request) { return client_.AskForError(request); }

  void AddBooks() {
    const JsonValue reply = Ask(R"({"command":"document_bulk","data":{"id":"books","documents":[
        {"id":"1","title":"The Old Man and the Sea"},
        {"id":"2","title":["Old Goriot","Father Goriot"]},
        {"id":"3"}]}})");
    ASSERT_TRUE(reply["success"].asBool()) << reply.toString();
  }

  // All terms that the replies to a "terms" request carry, as field:text.
  std::vector<std::string> Terms(const std::string& data) {
    std::vector<std::string> terms;
    for (const JsonValue& reply :
         client_.Exchange(R"({"command":"terms","data":{"id":"books")" + data + "}}")) {
      for (const Json::Value& term : reply["progress"]["terms"]) {
        terms.push_back(term["field"].asString() + ":" + term["text"].asString());
      }
    }
    return terms;
  }

  void WriteImport(const std::string& name, const std::string& text) {
    WriteFile(daemon_.data() + "/import/" + name, text);
  }

  DaemonClient client_ = Connect();
};

TEST_F(CommandsTest, ARequestIdIsEchoedInEveryReply) {
  AddBooks();
  for (const JsonValue& reply :
       client_.Exchange(R"({"command":"terms","data":{"id":"books"},"request_id":"mine"})")) {
    EXPECT_EQ(reply["request_id"].asString(), "mine");
    EXPECT_EQ(reply["command"].asString(), "terms");
  }
  EXPECT_EQ(Ask(R"({"command":"status","request_id":-2.5})")["request_id"].asDouble(), -2.5);
  EXPECT_FALSE(Ask(R"({"command":"status"})").isMember("request_id"));
}

TEST_F(CommandsTest, AFinalReplySaysHowLongItTook) {
  const JsonValue reply = Ask(R"({"command":"status"})");
  EXPECT_TRUE(reply["took_ms"].isUInt64());
  EXPECT_THAT(reply.getMemberNames(), ElementsAre("command", "result", "success", "took_ms"));
}

TEST_F(CommandsTest, IndexCreateFillsInDefaults) {
  const JsonValue reply = Ask(R"({"command":"index_create","data":{"id":"x","settings":{"fields":[
      {"name":"t","type":"text","term_vector":"positions_offsets","stored":false,"norms":false,"frequencies":false},
      {"name":"k","type":"keyword"}]}}})");
  ASSERT_TRUE(reply["success"].asBool()) << reply.toString();
  const Json::Value& fields = reply["result"]["settings"]["fields"];
  ASSERT_EQ(fields.size(), 3u);
  EXPECT_EQ(fields[0]["name"].asString(), "id");
  EXPECT_EQ(fields[0]["type"].asString(), "keyword");
  EXPECT_EQ(fields[1]["term_vector"].asString(), "positions_offsets");
  for (const char* name : {"stored", "norms", "frequencies"}) {
    EXPECT_FALSE(fields[1][name].asBool()) << name;
    EXPECT_TRUE(fields[2][name].asBool()) << name;
  }
  const JsonValue listed = Ask(R"({"command":"index_list","data":{"id":"x"}})");
  EXPECT_EQ(listed["result"]["indexes"][0]["settings"], reply["result"]["settings"]);
}

TEST_F(CommandsTest, IndexCreateRefusesWhatCannotBe) {
  EXPECT_EQ(Error(kCreateBooks), "index_exists");
  const auto create = [&](const std::string& name, const std::string& fields) {
    return Error(R"({"command":"index_create","data":{"id":")" + name + R"(","settings":{"fields":)" +
                 fields + "}}}");
  };
  for (const char* name : {"", "..", "a/b", "Books", "import", "-x"})
    EXPECT_EQ(create(name, "[]"), "bad_request");
  EXPECT_EQ(create("x", R"([{"name":"a","type":"text"},{"name":"a","type":"text"}])"), "bad_request");
  EXPECT_EQ(create("x", R"([{"name":"id","type":"text"}])"), "bad_request");
  EXPECT_EQ(create("x", R"([{"name":"a","type":"words"}])"), "bad_request");
  EXPECT_EQ(create("x", R"([{"name":"a"}])"), "bad_request");
  EXPECT_EQ(Error(R"({"command":"index_list","data":{"id":"x"}})"), "index_not_found");
  std::string many = "[";
  for (int i = 0; i <= 1000; ++i) {
    many += std::string(i == 0 ? "" : ",") + R"({"type":"text","name":"f)" + std::to_string(i) + "\"}";
  }
  EXPECT_EQ(create("x", many + "]"), "limit_exceeded");
}

TEST_F(CommandsTest, IndexListDescribesOneOrAll) {
  AddBooks();
  ASSERT_EQ(
      Error(
          R"({"command":"index_create","data":{"id":"a","settings":{"fields":[{"name":"text","type":"text"}]}}})"),
      "");
  const JsonValue all = Ask(R"({"command":"index_list"})");
  ASSERT_EQ(all["result"]["indexes"].size(), 2u);
  EXPECT_EQ(all["result"]["indexes"][0]["id"].asString(), "a");
  const Json::Value& books = all["result"]["indexes"][1];
  EXPECT_EQ(books["id"].asString(), "books");
  EXPECT_EQ(books["documents"].asInt(), 3);
  EXPECT_EQ(books["deleted"].asInt(), 0);
  EXPECT_GT(books["size_bytes"].asInt(), 100);
  const JsonValue one = Ask(R"({"command":"index_list","data":{"id":"books"}})");
  ASSERT_EQ(one["result"]["indexes"].size(), 1u);
  EXPECT_EQ(one["result"]["indexes"][0], books);
  EXPECT_EQ(Error(R"({"command":"index_list","data":{"id":"nope"}})"), "index_not_found");
}

TEST_F(CommandsTest, OneBadIndexDoesNotHideTheOthers) {
  const std::string bad = daemon_.data() + "/bad";
  CopyFolder(daemon_.data() + "/books", bad);
  WriteFile(bad + "/" + FindFile(bad, "_1"), "garbage");
  fs::create_directory(daemon_.data() + "/empty");
  const JsonValue all = Ask(R"({"command":"index_list"})");
  ASSERT_TRUE(all["success"].asBool()) << all.toString();
  EXPECT_EQ(all["result"]["indexes"][0]["error"]["code"].asString(), "corrupt") << all.toString();
  EXPECT_EQ(all["result"]["indexes"][1]["documents"].asInt(), 0);
  EXPECT_TRUE(all["result"]["indexes"][2].isMember("error"));
  EXPECT_EQ(Error(R"({"command":"index_list","data":{"id":"bad"}})"), "corrupt");
}

TEST_F(CommandsTest, IndexDeleteWantsTheNameTwice) {
  EXPECT_EQ(Error(R"({"command":"index_delete","data":{"id":"books"}})"), "bad_request");
  EXPECT_EQ(Error(R"({"command":"index_delete","data":{"id":"books","confirm":"book"}})"), "bad_request");
  EXPECT_EQ(Error(R"({"command":"index_delete","data":{"id":"nope","confirm":"nope"}})"), "index_not_found");
  EXPECT_EQ(Error(R"({"command":"index_delete","data":{"id":"*","confirm":"*"}})"), "index_not_found");
  EXPECT_EQ(Error(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"), "");
  EXPECT_FALSE(fs::exists(daemon_.data() + "/books"));
  EXPECT_EQ(Error(R"({"command":"index_list","data":{"id":"books"}})"), "index_not_found");
  EXPECT_EQ(Error(kCreateBooks), "");
}

TEST_F(CommandsTest, DocumentBulkCountsAndCommits) {
  AddBooks();
  EXPECT_EQ(CountBooks(client_), 3);
  EXPECT_THAT(Terms(R"(,"field":"title")"), ElementsAre("title:and", "title:father", "title:goriot",
                                                        "title:man", "title:old", "title:sea", "title:the"));
}

TEST_F(CommandsTest, ADocumentOfTheSameIdTakesThePlaceOfTheOneBefore) {
  AddBooks();
  EXPECT_EQ(Error(R"({"command":"document_bulk","data":{"id":"books","documents":[
      {"id":"1","title":"new"},{"id":"1","title":"newer"}]}})"),
            "");
  EXPECT_EQ(CountBooks(client_), 3);
  EXPECT_THAT(Terms(R"(,"field":"title","live":true)"),
              ElementsAre("title:father", "title:goriot", "title:newer", "title:old"));
}

TEST_F(CommandsTest, WithoutACommitTheDocumentsWaitForOne) {
  const JsonValue reply =
      Ask(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1"}],"commit":false}})");
  EXPECT_FALSE(reply["result"]["committed"].asBool());
  EXPECT_EQ(CountBooks(client_), 0);
  const JsonValue commit = Ask(R"({"command":"commit","data":{"id":"books"}})");
  EXPECT_TRUE(commit["result"]["committed"].asBool());
  EXPECT_EQ(commit["result"]["documents"].asInt(), 1);
  EXPECT_EQ(CountBooks(client_), 1);
}

TEST_F(CommandsTest, WhatFailsAfterACommitDoesNotHideThatItIsCommitted) {
  AddBooks();
  const std::string segment = daemon_.data() + "/books/_0.cfs";  // which is opened to be counted
  ASSERT_TRUE(fs::exists(segment));
  fs::remove(segment);
  for (const std::string command : {"commit", "optimize"}) {
    const JsonValue reply = Ask(R"({"command":")" + command + R"(","data":{"id":"books"}})");
    EXPECT_EQ(reply["error"]["code"].asString(), "io_error") << reply.toString();
    EXPECT_TRUE(reply["error"]["committed"].asBool()) << reply.toString();
  }
}

TEST_F(CommandsTest, WhatFailsBeforeACommitIsNotCommitted) {
  const auto writer = vantrel::elastic::Index::Open(daemon_.data() + "/books");
  writer->DeleteById("1");  // from now on it has the lock
  const JsonValue reply = Ask(R"({"command":"optimize","data":{"id":"books"}})");
  EXPECT_EQ(reply["error"]["code"].asString(), "locked") << reply.toString();
  EXPECT_FALSE(reply["error"].get("committed", true).asBool()) << reply.toString();
}

TEST_F(CommandsTest, BadDocumentsAreReportedAndTheOthersStay) {
  std::string documents = R"({"id":"good"})";
  for (const char* bad :
       {R"({"title":"x"})", R"({"id":""})", R"({"id":["a","b"]})", R"({"id":5})", "5", "null",
        R"({"id":"a","title":5})", R"({"id":"a","title":["x",null]})", R"({"id":"a","size":"1"})",
        R"({"id":"a","title":{"x":"y"}})", R"({"id":"a","title":"\udc00"})", R"([])"}) {
    documents += std::string(",") + bad;
  }
  const JsonValue reply =
      Ask(R"({"command":"document_bulk","data":{"id":"books","documents":[)" + documents + "]}}");
  EXPECT_FALSE(reply["success"].asBool());
  EXPECT_TRUE(reply["partial"].asBool());
  EXPECT_EQ(reply["error"]["code"].asString(), "bad_request");
  EXPECT_EQ(reply["result"]["indexed"].asInt(), 1);
  EXPECT_EQ(reply["result"]["failed"].asInt(), 12);
  EXPECT_TRUE(reply["result"]["committed"].asBool());
  const Json::Value& failures = reply["result"]["failures"];
  ASSERT_EQ(failures.size(), 10u);
  for (int i = 0; i < 10; ++i)
    EXPECT_EQ(failures[i]["position"].asInt(), i + 2) << failures[i]["reason"].asString();
  EXPECT_EQ(failures[2]["reason"].asString(), "field \"id\": the document has more than one id");
  EXPECT_NE(failures[8]["reason"].asString().find("\"size\""), std::string::npos);
  EXPECT_EQ(CountBooks(client_), 1);
}

TEST_F(CommandsTest, DocumentBulkReadsAFileOfTheImportFolder) {
  WriteImport("books.ndjson", "{\"id\":\"1\"}\n\n{oops\n{\"id\":\"2\"}\r\n  \n\xff\n{\"id\":\"3\"}");
  const JsonValue reply = Ask(R"({"command":"document_bulk","data":{"id":"books","file":"books.ndjson"}})");
  EXPECT_EQ(reply["result"]["indexed"].asInt(), 3) << reply.toString();
  EXPECT_EQ(reply["result"]["failed"].asInt(), 2);
  EXPECT_EQ(reply["result"]["failures"][0]["position"].asInt(), 3);
  EXPECT_EQ(reply["result"]["failures"][1]["position"].asInt(), 6);
  EXPECT_EQ(CountBooks(client_), 3);
}

TEST_F(CommandsTest, ALineOfABulkIsHeldToWhatARequestIs) {
  std::string values = "[0";
  for (int i = 2; i < 2000000; ++i) values += ",0";
  WriteImport("strict", "{\"id\":\"1\",\"title\":" + values + "]}\n" +
                            "{\"id\":\"2\",\"title\":" + std::string(1000, '[') + std::string(1000, ']') +
                            "}\n" + "{\"id\":\"3\",\"id\":\"4\"}\n{\"id\":\"5\"} // so\n{\"id\":\"6\"}\n");
  const JsonValue reply = Ask(R"({"command":"document_bulk","data":{"id":"books","file":"strict"}})");
  EXPECT_EQ(reply["result"]["indexed"].asInt(), 1) << reply.toString();
  const Json::Value& failures = reply["result"]["failures"];
  ASSERT_EQ(failures.size(), 4u);
  EXPECT_EQ(failures[0]["reason"].asString(), "json_values: at most 2000000 values");
  EXPECT_EQ(failures[1]["reason"].asString(), "json_depth: at most 1000 levels");
  EXPECT_NE(failures[2]["reason"].asString().find("Duplicate key: 'id'"), std::string::npos);
  EXPECT_NE(failures[3]["reason"].asString().find("a comment"), std::string::npos);
}

TEST_F(CommandsTest, ALongImportTellsHowFarItIs) {
  std::string lines;
  for (int i = 0; i < 2500; ++i) lines += "{\"id\":\"" + std::to_string(i) + "\"}\n";
  WriteImport("many", lines);
  const auto replies = client_.Exchange(R"({"command":"document_bulk","data":{"id":"books","file":"many"}})");
  ASSERT_GE(replies.size(), 3u);
  int last = 0;
  for (size_t i = 0; i + 1 < replies.size(); ++i) {
    const Json::Value& progress = replies[i]["progress"];
    EXPECT_GT(progress["indexed"].asInt(), last);
    EXPECT_EQ(progress["total_bytes"].asUInt64(), lines.size());
    EXPECT_LE(progress["bytes"].asUInt64(), lines.size());
    EXPECT_FALSE(replies[i].isMember("success"));
    last = progress["indexed"].asInt();
  }
  EXPECT_EQ(replies.back()["result"]["indexed"].asInt(), 2500);
}

TEST_F(CommandsTest, NothingOutsideTheImportFolderIsRead) {
  WriteFile(folder_ / "secret", "{\"id\":\"1\"}\n");
  fs::create_symlink(folder_ / "secret", daemon_.data() + "/import/link");
  for (const std::string& name : {std::string("../../secret"), folder_ / "secret", std::string("link"),
                                  std::string("missing"), std::string("../books/quorelastic.json")}) {
    EXPECT_EQ(Error(R"({"command":"document_bulk","data":{"id":"books","file":")" + name + "\"}}"),
              "bad_request")
        << name;
  }
}

TEST_F(CommandsTest, DocumentBulkWantsDocumentsOrAFile) {
  EXPECT_EQ(Error(R"({"command":"document_bulk","data":{"id":"books"}})"), "bad_request");
  EXPECT_EQ(Error(R"({"command":"document_bulk","data":{"id":"books","documents":[],"file":"x"}})"),
            "bad_request");
  EXPECT_EQ(Error(R"({"command":"document_bulk","data":{"id":"nope","documents":[]}})"), "index_not_found");
  EXPECT_EQ(Error(R"({"command":"document_bulk","data":{"id":"books","documents":[]}})"), "");
}

TEST_F(CommandsTest, DocumentDeleteDeletesById) {
  AddBooks();
  const JsonValue reply =
      Ask(R"({"command":"document_delete","data":{"id":"books","ids":["1","3","none"]}})");
  EXPECT_TRUE(reply["result"]["committed"].asBool()) << reply.toString();
  EXPECT_EQ(CountBooks(client_), 1);
  EXPECT_THAT(Terms(R"(,"field":"id","live":true)"), ElementsAre("id:2"));
  EXPECT_EQ(Error(R"({"command":"document_delete","data":{"id":"books","ids":["2"],"commit":false}})"), "");
  EXPECT_EQ(CountBooks(client_), 1);
  EXPECT_EQ(Error(R"({"command":"document_delete","data":{"id":"books","ids":[""]}})"), "bad_request");
}

TEST_F(CommandsTest, OptimizeLeavesTheDeletedDocumentsOut) {
  AddBooks();
  ASSERT_EQ(Error(R"({"command":"document_delete","data":{"id":"books","ids":["2"]}})"), "");
  const JsonValue reply = Ask(R"({"command":"optimize","data":{"id":"books"}})");
  EXPECT_EQ(reply["result"]["documents"].asInt(), 2) << reply.toString();
  EXPECT_EQ(reply["result"]["deleted"].asInt(), 0);
  EXPECT_THAT(Terms(R"(,"prefix":"goriot")"), IsEmpty());
}

TEST_F(CommandsTest, TermsAreSelectedByFieldPrefixAndNumber) {
  AddBooks();
  ASSERT_EQ(
      Error(
          R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"4","title":"old ozean"}]}})"),
      "");
  EXPECT_THAT(Terms(R"(,"prefix":"o")"), ElementsAre("title:old", "title:ozean"));
  EXPECT_THAT(Terms(R"(,"field":"id","max":2)"), ElementsAre("id:1", "id:2"));
  EXPECT_THAT(Terms(R"(,"max":0)"), IsEmpty());
  const JsonValue cut = Ask(R"({"command":"terms","data":{"id":"books","field":"id","max":3}})");
  EXPECT_EQ(cut["result"]["count"].asInt(), 3);
  EXPECT_TRUE(cut["result"]["more"].asBool());
  const JsonValue whole = Ask(R"({"command":"terms","data":{"id":"books","field":"id","max":4}})");
  EXPECT_EQ(whole["result"]["count"].asInt(), 4);
  EXPECT_FALSE(whole["result"]["more"].asBool());
  EXPECT_EQ(Error(R"({"command":"terms","data":{"id":"books","field":"nope"}})"), "bad_request");
  EXPECT_EQ(Error(R"({"command":"terms","data":{"id":"books","max":-1}})"), "bad_request");
}

TEST_F(CommandsTest, TermsAreOrderedByCodePointAcrossSegments) {
  for (const char* id : {"\xf0\x9f\x98\x80", "z", "\xef\xbf\xbd", "\xc3\xa4", "a", "z"}) {
    ASSERT_EQ(Error(std::string(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":")") +
                    id + "\"}]}}"),
              "");
  }
  EXPECT_THAT(Terms(""),
              ElementsAre("id:a", "id:z", "id:\xc3\xa4", "id:\xef\xbf\xbd", "id:\xf0\x9f\x98\x80"));
}

TEST_F(CommandsTest, LongTermListsComeInManyReplies) {
  const std::string words = ManyWords(5000);
  ASSERT_EQ(Error(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1","title":")" +
                  words + "\"}]}}"),
            "");
  const auto replies =
      client_.Exchange(R"({"command":"terms","data":{"id":"books","field":"title","max":1000000}})");
  EXPECT_GE(replies.size(), 6u);
  EXPECT_EQ(replies.back()["result"]["count"].asInt(), 5000);
  EXPECT_EQ(Terms(R"(,"field":"title","max":1000000)").size(), 5000u);
}

TEST_F(CommandsTest, StatusCountsWhatHappens) {
  DaemonClient other = Connect();
  other.Ask(R"({"command":"status"})");
  client_.Ask(R"({"command":"nope"})");
  const Json::Value status = Ask(R"({"command":"status"})")["result"];
  EXPECT_GE(status["connections"].asInt(), 2);
  EXPECT_EQ(status["data"].asString(), daemon_.data());
  EXPECT_EQ(status["protocol"].asString(), "1");
  EXPECT_EQ(status["requests"].asInt(), 4);
  EXPECT_EQ(status["failed_requests"].asInt(), 1);
  EXPECT_EQ(status["open_indexes"].asInt(), 0);
  CountBooks(client_);  // which opens it for a moment only
  EXPECT_EQ(Ask(R"({"command":"status"})")["result"]["open_indexes"].asInt(), 0);
  Ask(R"({"command":"commit","data":{"id":"books"}})");
  EXPECT_EQ(Ask(R"({"command":"status"})")["result"]["open_indexes"].asInt(), 1);
}

TEST_F(CommandsTest, HelpDescribesEveryCommandThatWorks) {
  const Json::Value help = Ask(R"({"command":"help"})")["result"];
  ASSERT_GE(help["commands"].size(), 10u);
  for (const Json::Value& command : help["commands"]) {
    EXPECT_NE(Error(R"({"command":")" + command["name"].asString() + R"(","data":{"nope":1}})"),
              "unknown_command");
  }
  const Json::Value one =
      Ask(R"({"command":"help","data":{"command":"index_create"}})")["result"]["commands"];
  ASSERT_EQ(one.size(), 1u);
  EXPECT_EQ(one[0]["members"][0]["name"].asString(), "id");
  EXPECT_EQ(one[0]["members"][1]["members"][0]["members"][1]["name"].asString(), "type");
  EXPECT_EQ(one[0]["members"][1]["members"][0]["members"][1]["type"].asString(), R"("text" or "keyword")");
  EXPECT_EQ(Error(R"({"command":"help","data":{"command":"nope"}})"), "unknown_command");
}

TEST_F(CommandsTest, AnIdThatNoDocumentCanHaveIsPassedOver) {
  Ask(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1"},{"id":"2"}]}})");
  const JsonValue reply = Ask(
      "{\"command\":\"document_delete\",\"data\":{\"id\":\"books\",\"ids\":[\"1\",\"\xef\xbf\xbf\",\"2\"]}}");
  EXPECT_TRUE(reply["success"].asBool()) << reply.toString();
  EXPECT_EQ(CountBooks(client_), 0);
}

class DebugLogTest : public ServedIndex {
 protected:
  DebugLogTest() : ServedIndex({"--log-level", "debug"}) {}
};

TEST_F(DebugLogTest, HasEveryRequestThatEndsInAnError) {
  DaemonClient client = Connect();
  client.Ask(R"({"command":"terms","data":{"id":"nope"}})");
  client.Ask(
      R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1"},{"title":"no id"}]}})");
  client.Ask(R"({"command":"nope"})");
  EXPECT_THAT(
      FindAll(daemon_.Log(), "debug: ([a-z_]+: [a-z_]+): "),
      ElementsAre(ElementsAre(_, "terms: index_not_found"), ElementsAre(_, "document_bulk: bad_request"),
                  ElementsAre(_, "request: unknown_command")));
}

}  // namespace
}  // namespace quorelastic::testing
