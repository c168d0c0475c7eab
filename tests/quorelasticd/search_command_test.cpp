// Searches through the daemon: what a request's members do, and what of a request is refused.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <future>
#include <string>
#include <vector>

#include "served_index.h"
#include "support/files.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

std::string Quote(const std::string& text) {
  JsonValue value;
  static_cast<Json::Value&>(value) = text;
  return value.toString();
}

std::string SearchRequest(const std::string& query, const std::string& more = "",
                          const std::string& indice = R"(["books"])") {
  return R"({"command":"search","data":{"indice":)" + indice + R"(,"query_string":{"query":)" + Quote(query) +
         "}" + (more.empty() ? "" : "," + more) + "}}";
}

std::string PluginFilter(const std::string& plugin, const std::string& data) {
  return R"({"name":"plugin","data":{"name":")" + plugin + R"(","data":)" + data + "}}";
}

std::vector<std::string> Ids(const Json::Value& reply) {
  std::vector<std::string> ids;
  for (const Json::Value& hit : reply["result"]["hits"]) ids.push_back(hit["id"].asString());
  return ids;
}

class SearchCommandTest : public ServedIndex {
 protected:
  SearchCommandTest() {
    EXPECT_EQ(client_.AskForError(
                  R"({"command":"document_bulk","data":{"id":"books","documents":[
                    {"id":"1","title":"old man and the sea"},
                    {"id":"2","title":["old goriot","father goriot"]},
                    {"id":"3","title":"moby dick, or the whale in the sea of an old man"}]}})"),
              "");
  }

  Json::Value Search(const std::string& query, const std::string& more = "") {
    return client_.Ask(SearchRequest(query, more));
  }

  std::string ErrorOf(const std::string& query, const std::string& more = "") {
    const Json::Value reply = Search(query, more);
    return reply["error"]["code"].asString() + ": " + reply["error"]["reason"].asString();
  }

  DaemonClient client_ = Connect();
};

TEST_F(SearchCommandTest, HitsComeBestFirstWithTheirFields) {
  const Json::Value reply = Search("old");
  EXPECT_TRUE(reply["success"].asBool());
  const Json::Value& result = reply["result"];
  EXPECT_EQ(result["total"], 3);
  EXPECT_EQ(result["query"], "title:old");
  EXPECT_THAT(Ids(reply), ElementsAre("2", "1", "3"));
  EXPECT_EQ(result["max_score"], result["hits"][0]["score"]);
  EXPECT_GT(result["hits"][0]["score"].asDouble(), result["hits"][2]["score"].asDouble());
  EXPECT_EQ(result["hits"][0]["fields"]["title"][1], "father goriot");
  EXPECT_EQ(result["hits"][1]["fields"]["title"], "old man and the sea");
  EXPECT_EQ(result["hits"][1]["index"], "books");
  EXPECT_TRUE(result["warnings"].empty());
}

TEST_F(SearchCommandTest, WhatIsNotFoundIsNoError) {
  const Json::Value reply = Search("oblomov");
  EXPECT_TRUE(reply["success"].asBool());
  EXPECT_EQ(reply["result"]["total"], 0);
  EXPECT_EQ(reply["result"]["max_score"].asDouble(), 0);
  EXPECT_TRUE(reply["result"]["hits"].isArray());
  EXPECT_THAT(Ids(reply), IsEmpty());
}

TEST_F(SearchCommandTest, PagesFollowOneAnother) {
  EXPECT_THAT(Ids(Search("old", R"("from":0,"size":2)")), ElementsAre("2", "1"));
  EXPECT_THAT(Ids(Search("old", R"("from":2,"size":2)")), ElementsAre("3"));
  EXPECT_THAT(Ids(Search("old", R"("from":3,"size":2)")), IsEmpty());
  EXPECT_EQ(Search("old", R"("from":0,"size":0)")["result"]["total"], 3);
}

TEST_F(SearchCommandTest, OnlyTheFieldsAskedForAreLoaded) {
  const Json::Value reply = Search("whale", R"("load_field":["title"])");
  EXPECT_EQ(reply["result"]["hits"][0]["fields"].getMemberNames(), std::vector<std::string>{"title"});
  EXPECT_EQ(reply["result"]["hits"][0]["id"], "3");
  EXPECT_TRUE(Search("whale", R"("load_field":[])")["result"]["hits"][0]["fields"].empty());
  const Json::Value unknown = Search("whale", R"("load_field":["title","year"])");
  EXPECT_EQ(unknown["result"]["warnings"][0], "there is no stored field \"year\" to load");
}

TEST_F(SearchCommandTest, FiltersKeepWhatAllOfThemLetThrough) {
  const std::string ids = PluginFilter("ids", R"({"values":["1","3"]})");
  const std::string whale = PluginFilter("term", R"({"field":"title","values":["whale","dick"]})");
  EXPECT_THAT(Ids(Search("old", R"("filters":[)" + ids + "]")), ElementsAre("1", "3"));
  EXPECT_THAT(Ids(Search("old", R"("filters":[)" + ids + "," + whale + "]")), ElementsAre("3"));
}

TEST_F(SearchCommandTest, AFilterWithAnEmptyNameIsNone) {
  const Json::Value reply = Search("old", R"("filters":[)" + PluginFilter("", "null") + "]");
  EXPECT_EQ(reply["result"]["total"], 3);
  EXPECT_TRUE(reply["result"]["warnings"].empty());
  const Json::Value with_data = Search("old", R"("filters":[)" + PluginFilter("", R"({"a":1})") + "]");
  EXPECT_EQ(with_data["result"]["total"], 3);
  EXPECT_THAT(with_data["result"]["warnings"][0].asString(), HasSubstr("without a plugin's name"));
}

TEST_F(SearchCommandTest, SeveralIndexesAreSearchedAsOne) {
  ASSERT_EQ(
      client_.AskForError(
          R"({"command":"index_create","data":{"id":"films","settings":{"fields":[{"name":"title","type":"text"}]}}})"),
      "");
  ASSERT_EQ(
      client_.AskForError(
          R"({"command":"document_bulk","data":{"id":"films","documents":[{"id":"1","title":"sea"}]}})"),
      "");
  const Json::Value reply = client_.Ask(SearchRequest("sea", "", R"(["books","films"])"));
  EXPECT_EQ(reply["result"]["total"], 3);
  EXPECT_EQ(reply["result"]["hits"][0]["index"], "films");
  EXPECT_EQ(reply["result"]["hits"][1]["index"], "books");
}

TEST_F(SearchCommandTest, WhatIsNotCommittedIsNotFound) {
  const std::string add =
      R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"9","title":"oblomov"}],"commit":false}})";
  ASSERT_EQ(client_.AskForError(add), "");
  EXPECT_EQ(Search("oblomov")["result"]["total"], 0);
  ASSERT_EQ(client_.AskForError(R"({"command":"commit","data":{"id":"books"}})"), "");
  EXPECT_EQ(Search("oblomov")["result"]["total"], 1);
}

TEST_F(SearchCommandTest, RequestsThatMakeNoSenseAreRefused) {
  EXPECT_EQ(ErrorOf("old", R"("filters":[{"name":"range","data":{"name":""}}])"),
            "bad_request: data.filters[0].name: expected \"plugin\", found \"range\"");
  EXPECT_EQ(ErrorOf("old", R"("filters":[{"name":"plugin"}])"),
            "bad_request: data.filters[0].data: missing; expected an object");
  EXPECT_EQ(ErrorOf("old", R"("load_field":"title")"),
            "bad_request: data.load_field: expected an array of strings, found a string");
  EXPECT_EQ(ErrorOf("old", R"("load_field":[5])"),
            "bad_request: data.load_field[0]: expected a string, found a number");
  EXPECT_EQ(ErrorOf("old", R"("size":-1)"),
            "bad_request: data.size: expected an integer of 0 or more, found -1");
  EXPECT_THAT(ErrorOf("old", R"("from":1e30)"), HasSubstr("bad_request: data.from: expected"));
  EXPECT_EQ(ErrorOf("old", R"("query":"old")").substr(0, 36), "bad_request: data: unknown member \"q");
  EXPECT_EQ(client_.AskForError(SearchRequest("old", "", "[]")), "bad_request");
  EXPECT_EQ(client_.AskForError(SearchRequest("old", "", R"(["books","books"])")), "bad_request");
  EXPECT_EQ(client_.AskForError(SearchRequest("old", "", R"(["books","films"])")), "index_not_found");
  EXPECT_EQ(client_.AskForError(SearchRequest("old", "", R"(["../books"])")), "index_not_found");
  EXPECT_THAT(ErrorOf(""), HasSubstr("query_syntax: "));
  EXPECT_EQ(Search("old")["result"]["total"], 3) << "the connection is of no use any more";
}

TEST_F(SearchCommandTest, QueriesBeyondALimitAreRefusedByItsName) {
  const auto limit = [&](const std::string& query, const std::string& more = "") {
    const Json::Value error = Search(query, more)["error"];
    EXPECT_EQ(error["code"], "limit_exceeded");
    EXPECT_TRUE(error["most"].isUInt64());
    return error["limit"].asString();
  };
  EXPECT_EQ(limit(std::string(7000, '(') + "old" + std::string(7000, ')')), "query_depth");
  EXPECT_EQ(limit(std::string(20000, '(')), "query_bytes");
  EXPECT_EQ(limit("old", R"("from":10000)"), "window");
  EXPECT_EQ(limit("old", R"("size":9223372036854775807,"from":9223372036854775807)"), "window");
  std::string words;
  for (int i = 0; i < 2000; ++i) words.append("w").append(std::to_string(i)).append(" ");
  EXPECT_EQ(limit(words), "query_clauses");
  EXPECT_EQ(limit("\"a b c d e f g h i j k l m n o p q\"~5"), "near_words");
  EXPECT_EQ(Search("\"a b c d e f g h i j k l m n o p q\"")["error"], Json::Value());
  std::string indice;
  for (int i = 0; i < 65; ++i) indice.append(i == 0 ? "[\"i" : "\",\"i").append(std::to_string(i));
  EXPECT_EQ(client_.Ask(SearchRequest("old", "", indice + "\"]"))["error"]["limit"], "data.indice");
}

TEST_F(SearchCommandTest, ScoresBeyondAllMeasureAreStillNumbers) {
  std::string query = "old";
  for (int i = 0; i < 60; ++i) query = "(" + query + ")^1000000 sea";
  const Json::Value reply = Search(query);
  EXPECT_TRUE(reply["success"].asBool());
  EXPECT_LE(reply["result"]["max_score"].asDouble(), 3.5e38);
}

TEST_F(SearchCommandTest, WhatPreProcessorsWouldBlowUpIsRefused) {
  std::string steps;
  for (const char* length : {"200", "150", "100", "60", "40", "20", "8", "2"}) {
    steps += std::string(steps.empty() ? "" : ",") + R"({"name":"ngram","argument":")" + length + "\"}";
  }
  ASSERT_EQ(
      client_.AskForError(
          R"({"command":"index_create","data":{"id":"grams","settings":{"fields":[{"name":"t","type":"text",)"
          R"("pre_processors":[)" +
          steps + "]}]}}}"),
      "");
  const std::string word(255, 'x');
  EXPECT_EQ(client_.AskForError(R"({"command":"analyze","data":{"id":"grams","field":"t","text":")" + word +
                                "\"}}"),
            "bad_request");
  EXPECT_EQ(client_.AskForError(SearchRequest("t:" + word, "", R"(["grams"])")), "limit_exceeded");
}

TEST_F(SearchCommandTest, AnIndexThatIsSearchedIsNotTakenAway) {
  EXPECT_EQ(client_.AskForError(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"), "");
  EXPECT_EQ(client_.AskForError(SearchRequest("old")), "index_not_found");
}

class LoadedPluginTest : public ::testing::Test {
 protected:
  LoadedPluginTest() {
    fs::create_directory(folder_ / "plugins");
    fs::copy_file(PAUSE_PLUGIN, folder_ / "plugins/pause.so");
    fs::permissions(folder_ / "plugins/pause.so", fs::perms::owner_all);
  }

  std::vector<std::string> Arguments() const { return {"--plugins", folder_ / "plugins"}; }

  static void MakeBooks(DaemonClient& client) {
    ASSERT_EQ(
        client.AskForError(
            R"({"command":"index_create","data":{"id":"books","settings":{"fields":[{"name":"title","type":"text"}]}}})"),
        "");
    ASSERT_EQ(
        client.AskForError(
            R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1","title":"old"}]}})"),
        "");
  }

  static std::string PausingSearch(int milliseconds) {
    return SearchRequest(
        "old", R"("filters":[)" +
                   PluginFilter("pause", R"({"milliseconds":)" + std::to_string(milliseconds) + "}") + "]");
  }

  TemporaryFolder folder_;
};

TEST_F(LoadedPluginTest, APluginOfTheFolderIsListedAndUsed) {
  DaemonProcess daemon(folder_.path(), Arguments());
  ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
  DaemonClient client(daemon.socket());
  MakeBooks(client);
  std::vector<std::string> names;
  const Json::Value plugins = client.Ask(R"({"command":"plugin_list"})")["result"]["plugins"];
  for (const Json::Value& plugin : plugins) names.push_back(plugin["name"].asString());
  EXPECT_THAT(names, ElementsAre("category", "ids", "pause", "range", "term"));
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(client.Ask(PausingSearch(200))["result"]["total"], 1);
  EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(200));
}

TEST_F(LoadedPluginTest, SlowSearchesHoldUpNoOtherRequests) {
  std::vector<std::string> arguments = Arguments();
  arguments.insert(arguments.end(), {"--threads", "2"});
  DaemonProcess daemon(folder_.path(), arguments);
  ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
  DaemonClient client(daemon.socket());
  MakeBooks(client);
  DaemonClient slow(daemon.socket());
  DaemonClient as_slow(daemon.socket());
  ASSERT_TRUE(slow.Send(PausingSearch(20'000)));
  ASSERT_TRUE(as_slow.Send(PausingSearch(20'000)));
  EXPECT_EQ(client.AskForError(R"({"command":"status"})"), "");
  EXPECT_EQ(client.AskForError(R"({"command":"index_list"})"), "");
  EXPECT_EQ(client.AskForError(
                R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"2","title":"x"}]}})"),
            "");
  EXPECT_EQ(client.AskForError(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"),
            "locked");
}

TEST_F(LoadedPluginTest, ASearchThatDoesNotEndDoesNotKeepTheDaemonFromEnding) {
  std::vector<std::string> arguments = Arguments();
  arguments.insert(arguments.end(), {"--shutdown-timeout", "1"});
  DaemonProcess daemon(folder_.path(), arguments);
  DaemonClient client(daemon.socket());
  MakeBooks(client);
  DaemonClient slow(daemon.socket());
  ASSERT_TRUE(slow.Send(PausingSearch(600'000)));
  EXPECT_EQ(client.AskForError(R"({"command":"status"})"), "");
  EXPECT_EQ(daemon.Stop(), 1);
  EXPECT_THAT(daemon.Log(), HasSubstr("does not end in time"));
}

TEST_F(LoadedPluginTest, AFolderThatIsNotFitKeepsTheDaemonFromStarting) {
  fs::permissions(folder_ / "plugins", fs::perms::all);
  DaemonProcess open_to_all(folder_.path(), Arguments());
  EXPECT_FALSE(open_to_all.is_ready());
  EXPECT_EQ(open_to_all.Wait(), 1);
  EXPECT_THAT(open_to_all.Log(), HasSubstr("can be written by others"));
  DaemonProcess missing(folder_.path(), {"--plugins", folder_ / "nowhere"});
  EXPECT_EQ(missing.Wait(), 1);
  EXPECT_THAT(missing.Log(), HasSubstr(folder_ / "nowhere"));
}

TEST_F(SearchCommandTest, AnalysisShowsTheTermsOfAField) {
  const Json::Value reply =
      client_.Ask(R"({"command":"analyze","data":{"id":"books","field":"title","text":"Älter, wiser"}})");
  const Json::Value& tokens = reply["result"]["tokens"];
  ASSERT_EQ(tokens.size(), 2u);
  EXPECT_EQ(tokens[0]["text"], "älter");
  EXPECT_EQ(tokens[1]["text"], "wiser");
  EXPECT_EQ(tokens[1]["start"], 7);
  EXPECT_EQ(tokens[1]["end"], 12);
  EXPECT_EQ(client_.AskForError(R"({"command":"analyze","data":{"id":"books","field":"x","text":"a"}})"),
            "bad_request");
}

TEST_F(SearchCommandTest, APrefixIsCompletedByTheMostFrequentTerms) {
  const auto suggest = [&](const std::string& prefix, const std::string& more = "") {
    const Json::Value reply =
        client_.Ask(R"({"command":"suggest","data":{"indice":["books"],"field":"title","prefix":")" + prefix +
                    "\"" + more + "}}");
    std::vector<std::string> terms;
    for (const Json::Value& term : reply["result"]["suggestions"]) {
      terms.push_back(term["term"].asString() + " " + term["doc_freq"].asString());
    }
    if (!reply["success"].asBool()) terms.push_back(reply["error"]["code"].asString());
    return terms;
  };
  EXPECT_THAT(suggest("o"), ElementsAre("old 3", "of 1", "or 1"));
  EXPECT_THAT(suggest("o", R"(,"from":1,"size":1)"), ElementsAre("of 1"));
  EXPECT_THAT(suggest("O"), IsEmpty());
  EXPECT_THAT(suggest("o", R"(,"size":10001)"), ElementsAre("limit_exceeded"));
  EXPECT_EQ(client_.AskForError(
                R"({"command":"suggest","data":{"indice":["films"],"field":"title","prefix":"o"}})"),
            "index_not_found");
}

TEST_F(SearchCommandTest, QueriesGoThroughTheSamePreProcessorsAsValues) {
  ASSERT_EQ(client_.AskForError(
                R"({"command":"index_create","data":{"id":"names","settings":{"fields":[
                  {"name":"name","type":"keyword","pre_processors":[{"name":"tolower"}]},
                  {"name":"part","type":"text","pre_processors":[{"name":"ngram","argument":"2"}]}]}}})"),
            "");
  ASSERT_EQ(client_.AskForError(
                R"({"command":"document_bulk","data":{"id":"names","documents":[
                  {"id":"1","name":"Anna","part":"Anna"},{"id":"2","name":"ANNA","part":"Hanno"}]}})"),
            "");
  const auto find = [&](const std::string& query) {
    return Ids(client_.Ask(SearchRequest(query, "", R"(["names"])")));
  };
  EXPECT_THAT(find("name:aNNa"), ElementsAre("1", "2"));
  EXPECT_THAT(find("part:na"), ElementsAre("1"));
  EXPECT_THAT(find("part:no"), ElementsAre("2"));
  EXPECT_EQ(client_.AskForError(
                R"({"command":"index_create","data":{"id":"x","settings":{"fields":[
                  {"name":"name","type":"text","pre_processors":[{"name":"ngram","argument":"0"}]}]}}})"),
            "bad_request");
  const Json::Value reply = client_.Ask(
      R"({"command":"index_create","data":{"id":"x","settings":{"fields":[{"name":"name","type":"text",
          "frequencies":false,"pre_processors":[{"name":"ngram","argument":"2"}]}]}}})");
  EXPECT_EQ(reply["error"]["code"].asString(), "bad_request");
  EXPECT_THAT(reply["error"]["reason"].asString(), HasSubstr("\"ngram\" needs frequencies"));
}

TEST_F(SearchCommandTest, ADocumentStaysWhenItsReplacementIsRefused) {
  EXPECT_EQ(
      client_.AskForError(
          R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1","year":"1952"}]}})"),
      "bad_request");
  EXPECT_THAT(Ids(Search("man")), ElementsAre("1", "3"));
}

}  // namespace
}  // namespace quorelastic::testing
