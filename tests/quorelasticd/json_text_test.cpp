#include "commands/json_text.h"

#include <gtest/gtest.h>

#include <string>

#include "errors/request_error.h"
#include "vantrel/elastic/json_value.h"

namespace quorelasticd {
namespace {

int64_t CountValues(const Json::Value& value) {
  int64_t count = 1;
  if (!value.isArray() && !value.isObject()) return count;
  for (const Json::Value& inner : value) count += CountValues(inner);
  return count;
}

TEST(JsonText, IsCountedAsItIsThenMade) {
  for (const char* text :
       {"0", "[]", "{}", "[ ]", "{\n}", "[[]]", "[[],[]]", "[1,2]", R"({"a":1})", R"({"a":{}})",
        R"({"a":{"b":[1,[2,[]],{}]},"c":"d"})", R"(["a,b","[{","\\",":\"",""])", R"("[,")"}) {
    const Json::Value made = ParseJson(text, "the text");
    EXPECT_EQ(OutlineOf(text).values, CountValues(made)) << text;
  }
  EXPECT_EQ(OutlineOf(R"([{"a":["[[["]}])").depth, 3);
}

TEST(JsonText, IsUnderstoodAsTheEngineUnderstandsIt) {
  for (const char* text :
       {"1e3", "-0", "18446744073709551615", "-9223372036854775808", "1.5", "123456789012345678901",
        R"("\u00e9\ud83d\ude00\/")", R"("é😀")", "true", "null", R"({"b":1,"a":[2]})"}) {
    vantrel::elastic::JsonValue expected;
    ASSERT_TRUE(expected.fromString(text)) << text;
    EXPECT_EQ(ParseJson(text, "the text"), expected) << text;
  }
  for (const char* text :
       {"01", "+1", ".5", "1.", "'a'", "[1,]", "[,1]", "{a:1}", R"("\x")", "NaN", "1 2", "[", "]"}) {
    vantrel::elastic::JsonValue expected;
    EXPECT_EQ(expected.fromString(text), [&] {
      try {
        ParseJson(text, "the text");
        return true;
      } catch (const RequestError&) {
        return false;
      }
    }()) << text;
  }
}

TEST(JsonText, AZeroByteDoesNotEndIt) {
  EXPECT_THROW(ParseJson(std::string("{}\0 x", 5), "the text"), RequestError);
  EXPECT_THROW(ParseJson(std::string("{}\0", 3), "the text"), RequestError);
}

TEST(JsonText, AMemberIsLeftOutOfIt) {
  EXPECT_EQ(WithoutMember(R"({"a":[1,{"b":"]"}],"b":"x,\"","c":2})", "b"),
            R"({"a":[1,{"b":"]"}],"b":null,"c":2})");
  EXPECT_EQ(WithoutMember(R"( { "b" : {"b":[]} , "c":2})", "b"), R"( { "b" :null, "c":2})");
  EXPECT_EQ(WithoutMember(R"({"a":1,"b":2})", "b"), R"({"a":1,"b":null})");
  for (const char* text :
       {"", "{", "[]", R"({"a":1})", R"({"a")", R"({"a":)", R"({"a":"b)", R"("b":1)", R"({b:1})"}) {
    EXPECT_EQ(WithoutMember(text, "b"), text);
  }
}

}  // namespace
}  // namespace quorelasticd
