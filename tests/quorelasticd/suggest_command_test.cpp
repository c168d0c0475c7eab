// The daemon's "suggest" where what it is asked, or what it reads, is not as it should be.

#include <gmock/gmock.h>

#include <filesystem>
#include <string>

#include "served_index.h"
#include "support/files.h"

namespace quorelastic::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

class SuggestCommandTest : public ServedIndex {
 protected:
  SuggestCommandTest() {
    EXPECT_EQ(client_.AskForError(R"({"command":"document_bulk","data":{"id":"books","documents":[
                {"id":"1","title":"\u00c4rger old"},{"id":"2","title":"\u00f6l old"},{"id":"3","title":"\ud83d\ude00x4"}]}})"),
              "");
  }

  // `prefix` as it stands in JSON, between quotes.
  static std::string Request(const std::string& prefix, const std::string& field = "title",
                             const std::string& index = "books") {
    return R"({"command":"suggest","data":{"indice":[")" + index + R"("],"field":")" + field +
           R"(","prefix":")" + prefix + "\"}}";
  }

  // The terms, or the error's code.
  std::vector<std::string> Suggest(const std::string& prefix, const std::string& field = "title") {
    const JsonValue reply = client_.Ask(Request(prefix, field));
    if (!reply["success"].asBool()) return {reply["error"]["code"].asString()};
    std::vector<std::string> terms;
    for (const Json::Value& suggestion : reply["result"]["suggestions"]) {
      terms.push_back(suggestion["term"].asString());
    }
    return terms;
  }

  DaemonClient client_ = Connect();
};

TEST_F(SuggestCommandTest, AnEmptyPrefixBeginsEveryTerm) {
  EXPECT_THAT(Suggest(""), ElementsAre("old", "\xc3\xa4rger", "\xc3\xb6l", "\xf0\x9f\x98\x80x4"));
}

TEST_F(SuggestCommandTest, AnEmptyFieldIsOneThatIsNotThere) {
  const JsonValue reply = client_.Ask(Request("o", ""));
  EXPECT_TRUE(reply["success"].asBool()) << reply.toString();
  EXPECT_TRUE(reply["result"]["suggestions"].empty());
  EXPECT_EQ(reply["result"]["warnings"][0].asString(), "there is no field \"\"");
}

TEST_F(SuggestCommandTest, APrefixMayBeEscaped) {
  EXPECT_THAT(Suggest("\\u00e4r"), ElementsAre("\xc3\xa4rger"));
  EXPECT_THAT(Suggest("\\u006f\\u006c"), ElementsAre("old"));
  EXPECT_THAT(Suggest("\\ud83d\\ude00"), ElementsAre("\xf0\x9f\x98\x80x4"));
  EXPECT_THAT(Suggest("o\\u0000"), IsEmpty());
}

TEST_F(SuggestCommandTest, APrefixThatIsNoTextIsABadRequest) {
  for (const char* prefix : {"\xff", "\xc3", "o\xc3", "\xf0\x9f\x98", "\xed\xa0\x80", "\\ud83d", "\\ude00",
                             "o\\ud83dx", "\\u12", "\\x41"}) {
    EXPECT_THAT(Suggest(prefix), ElementsAre("bad_request")) << prefix;
  }
  EXPECT_THAT(Suggest("o"), ElementsAre("old")) << "the connection goes on";
}

TEST_F(SuggestCommandTest, WhatIsMissingOrOfAnotherKindIsABadRequest) {
  for (const char* data :
       {R"({})", R"({"indice":["books"],"field":"title"})", R"({"indice":["books"],"prefix":"o"})",
        R"({"field":"title","prefix":"o"})", R"({"indice":[],"field":"title","prefix":"o"})",
        R"({"indice":["books"],"field":1,"prefix":"o"})",
        R"({"indice":["books"],"field":"title","prefix":null})",
        R"({"indice":["books"],"field":"title","prefix":"o","size":-1})",
        R"({"indice":["books"],"field":"title","prefix":"o","from":1.5})"}) {
    EXPECT_EQ(client_.AskForError(std::string(R"({"command":"suggest","data":)") + data + "}"), "bad_request")
        << data;
  }
}

TEST_F(SuggestCommandTest, AnUnknownIndexIsNotFoundAlsoBesideAKnownOne) {
  EXPECT_EQ(client_.AskForError(Request("o", "title", "films")), "index_not_found");
  EXPECT_EQ(client_.AskForError(Request("o", "title", R"(books","films)")), "index_not_found");
}

TEST_F(SuggestCommandTest, ADamagedDictionaryIsCorruptAndNamesTheFileAndTheOffset) {
  const std::string books = daemon_.data() + "/books/";
  std::string file;
  for (const std::string& name : ListFolder(books)) {
    if (name.ends_with(".cfs")) file = name;
  }
  ASSERT_FALSE(file.empty());
  std::string bytes = ReadFile(books + file);
  const size_t term = bytes.find("ld", bytes.find("\x03old"));  // of the dictionary: a length before the text
  ASSERT_NE(term, std::string::npos);
  bytes[term] = '\xff';
  std::filesystem::remove(books + file);
  WriteFile(books + file, bytes);
  const JsonValue reply = client_.Ask(Request("o"));
  EXPECT_EQ(reply["error"]["code"].asString(), "corrupt") << reply.toString();
  EXPECT_THAT(reply["error"]["reason"].asString(), HasSubstr(file));
  EXPECT_THAT(reply["error"]["reason"].asString(), HasSubstr("offset"));
}

}  // namespace
}  // namespace quorelastic::testing
