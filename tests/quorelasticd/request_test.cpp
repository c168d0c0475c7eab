#include "commands/request.h"

#include <gtest/gtest.h>

#include <set>
#include <string>

#include "base/limits.h"
#include "commands/command_table.h"

namespace quorelasticd {
namespace {

std::string Nested(int levels) {
  return R"({"command":"status","data":)" + std::string(static_cast<size_t>(levels), '[') +
         std::string(static_cast<size_t>(levels), ']') + "}";
}

TEST(Request, KnowsItsCommandIdAndData) {
  const Request request = ParseRequest(R"({"command":"commit","data":{"id":"x"},"request_id":"r"})");
  ASSERT_FALSE(request.error.has_value()) << request.error->reason();
  EXPECT_EQ(request.command->name, "commit");
  EXPECT_EQ(request.request_id.asString(), "r");
  EXPECT_EQ(request.data["id"].asString(), "x");
}

TEST(Request, WhatCanBeToldIsToldOfABadOneToo) {
  const Request bad_data = ParseRequest(R"({"command":"commit","data":{},"request_id":7})");
  EXPECT_EQ(bad_data.error->reason(), "data.id: missing; expected a string");
  EXPECT_EQ(bad_data.command->name, "commit");
  EXPECT_EQ(bad_data.request_id.asInt(), 7);
  const Request bad_name = ParseRequest(R"({"command":"nope","request_id":7})");
  EXPECT_EQ(bad_name.error->code(), ErrorCode::kUnknownCommand);
  EXPECT_EQ(bad_name.command, nullptr);
  EXPECT_EQ(bad_name.request_id.asInt(), 7);
}

TEST(Request, AnIdThatCannotBeEchoedIsNot) {
  for (const char* id : {"true", "{}", "[1]", "null", "\"\"", "\"\\udc00\""}) {
    const Request request = ParseRequest(std::string(R"({"command":"status","request_id":)") + id + "}");
    ASSERT_TRUE(request.error.has_value()) << id;
    EXPECT_EQ(request.error->code(), ErrorCode::kBadRequest) << id;
    EXPECT_EQ(request.error->reason().rfind("request_id", 0), 0u) << request.error->reason();
  }
  const Request longest =
      ParseRequest(R"({"command":"status","request_id":")" + std::string(256, 'x') + "\"}");
  EXPECT_FALSE(longest.error.has_value());
  const Request longer =
      ParseRequest(R"({"command":"status","request_id":")" + std::string(257, 'x') + "\"}");
  EXPECT_EQ(longer.error->code(), ErrorCode::kLimitExceeded);
  EXPECT_TRUE(longer.request_id.isNull());
}

TEST(Request, TextThatIsNoJsonIsRefusedWithThePlace) {
  for (const char* text : {"", " ", "{", "{]", "nul", "{\"command\":\"status\"} x", "\x01"}) {
    const Request request = ParseRequest(text);
    ASSERT_TRUE(request.error.has_value()) << text;
    EXPECT_EQ(request.error->code(), ErrorCode::kBadRequest);
    EXPECT_EQ(request.error->reason().rfind("the request is no JSON document: Line 1", 0), 0u)
        << request.error->reason();
  }
}

TEST(Request, BytesThatAreNoUtf8AreRefusedWithThePlace) {
  const Request request = ParseRequest("{\"command\":\"\xff\"}");
  EXPECT_EQ(request.error->reason(), "the request is no valid UTF-8: byte 12 (counted from 0)");
}

TEST(Request, JsonThatIsNoObjectIsRefused) {
  for (const char* text : {"[]", "1", "null", "true", "\"status\""}) {
    const Request request = ParseRequest(text);
    ASSERT_TRUE(request.error.has_value()) << text;
    EXPECT_EQ(request.error->reason().rfind("the request: expected an object", 0), 0u)
        << request.error->reason();
  }
}

TEST(Request, TooDeepJsonNamesTheLimit) {
  const Request deepest = ParseRequest(Nested(999));
  EXPECT_EQ(deepest.error->code(), ErrorCode::kBadRequest) << deepest.error->reason();
  for (const int levels : {1000, 2000, 1000000}) {
    const Request request = ParseRequest(Nested(levels));
    EXPECT_EQ(request.error->code(), ErrorCode::kLimitExceeded) << levels << request.error->reason();
    EXPECT_EQ(request.error->details()["limit"].asString(), "json_depth");
  }
  // Brackets within strings are none.
  const Request flat = ParseRequest(R"({"command":"\"[[[",)" + std::string(2000, '"'));
  EXPECT_EQ(flat.error->code(), ErrorCode::kBadRequest);
}

std::string Values(int64_t count) {
  std::string text = "[0";
  for (int64_t i = 1; i < count; ++i) text += ",0";
  return text + "]";
}

TEST(Request, TooManyValuesNameTheLimit) {
  constexpr int64_t kAround = 3;  // the request, the command and the array
  const auto request = [](int64_t values) {
    return ParseRequest(R"({"command":"commit","data":)" + Values(values - kAround) + "}");
  };
  EXPECT_EQ(request(kMostJsonValues).error->code(), ErrorCode::kBadRequest);
  const Request refused = request(kMostJsonValues + 1);
  EXPECT_EQ(refused.error->code(), ErrorCode::kLimitExceeded);
  EXPECT_EQ(refused.error->details()["limit"].asString(), "json_values");
}

TEST(Request, WhatIsRefusedForItsSizeIsStillKnown) {
  for (const std::string& data : {Values(kMostJsonValues), std::string(5000, '[') + std::string(5000, ']')}) {
    for (const std::string& text :
         {R"({"command":"commit","data":)" + data + R"(,"request_id":"r"})",
          R"( { "data" : )" + data + R"( , "request_id":"r", "command":"commit"})"}) {
      const Request request = ParseRequest(text);
      EXPECT_EQ(request.error->code(), ErrorCode::kLimitExceeded);
      ASSERT_NE(request.command, nullptr) << text.substr(0, 40);
      EXPECT_EQ(request.command->name, "commit");
      EXPECT_EQ(request.request_id.asString(), "r");
    }
  }
  const Request unknown = ParseRequest(R"({"command":)" + Values(kMostJsonValues) + R"(,"request_id":"r"})");
  EXPECT_EQ(unknown.command, nullptr);
  EXPECT_TRUE(unknown.request_id.isNull());
}

TEST(Request, WhatIsJsonByCourtesyOnlyIsRefused) {
  const struct {
    const char* text;
    const char* reason;
  } cases[] = {
      {R"({"command":"status"} // so)", "a comment, or a stray /, at byte 21 (counted from 0)"},
      {R"(/* so */ {"command":"status"})", "a comment, or a stray /, at byte 0 (counted from 0)"},
      {"\xef\xbb\xbf{\"command\":\"status\"}", "it begins with a byte order mark"},
      {R"({"command":"status","command":"help"})", "Line 1, Column 21   Duplicate key: 'command'"},
      {R"({"command":"commit","data":{"id":"a","id":"b"}})", "Line 1, Column 38   Duplicate key: 'id'"},
  };
  for (const auto& [text, reason] : cases) {
    const Request request = ParseRequest(text);
    ASSERT_TRUE(request.error.has_value()) << text;
    EXPECT_EQ(request.error->code(), ErrorCode::kBadRequest);
    EXPECT_EQ(request.error->reason(), std::string("the request is no JSON document: ") + reason);
  }
  EXPECT_FALSE(ParseRequest(R"({"command":"status","request_id":"// \u0041 \" /*"})").error.has_value());
}

TEST(Request, UnknownMembersAreRefused) {
  const Request request = ParseRequest(R"({"command":"status","comand":1})");
  EXPECT_EQ(request.error->reason(),
            R"(the request: unknown member "comand"; expected: "command", "data", "request_id")");
}

TEST(Request, DataMayBeLeftOutWhereNothingIsRequired) {
  EXPECT_FALSE(ParseRequest(R"({"command":"status"})").error.has_value());
  EXPECT_FALSE(ParseRequest(R"({"command":"index_list"})").error.has_value());
  EXPECT_TRUE(ParseRequest(R"({"command":"commit"})").error.has_value());
  EXPECT_EQ(ParseRequest(R"({"command":"status","data":null})").error->reason(),
            "data: expected an object, found null");
}

void ExpectDescribed(const Shape& shape, const std::string& where) {
  std::set<std::string> names;
  for (const Member& member : shape.members) {
    const std::string path = where + "." + member.name;
    EXPECT_TRUE(names.insert(member.name).second) << path;
    EXPECT_TRUE(member.meaning.ends_with(".")) << path;
    ExpectDescribed(member.shape, path);
    for (const Shape& inner : member.shape.of) ExpectDescribed(inner, path);
  }
}

TEST(CommandTable, DescribesEveryCommandAndMember) {
  std::set<std::string> names;
  for (const Command& command : CommandTable()) {
    EXPECT_TRUE(names.insert(command.name).second) << command.name;
    EXPECT_TRUE(command.summary.ends_with(".")) << command.name;
    EXPECT_EQ(command.data.kind, Shape::Kind::kObject) << command.name;
    EXPECT_NE(command.begin, nullptr) << command.name;
    EXPECT_EQ(FindCommand(command.name), &command);
    ExpectDescribed(command.data, command.name);
  }
  EXPECT_EQ(FindCommand(""), nullptr);
  EXPECT_EQ(FindCommand("Status"), nullptr);
}

}  // namespace
}  // namespace quorelasticd
