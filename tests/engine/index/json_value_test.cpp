#include "vantrel/elastic/json_value.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>

#include "support/files.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;

JsonValue Parsed(const std::string& text) {
  JsonValue value;
  EXPECT_TRUE(value.fromString(text)) << text;
  return value;
}

std::string Nested(size_t levels) { return std::string(levels, '[') + std::string(levels, ']'); }

TEST(JsonValueTest, IntegersComeThroughExactly) {
  EXPECT_EQ(Parsed("-9223372036854775808").asInt64(), std::numeric_limits<int64_t>::min());
  EXPECT_EQ(Parsed("9223372036854775807").asInt64(), std::numeric_limits<int64_t>::max());
  EXPECT_EQ(Parsed("18446744073709551615").asUInt64(), std::numeric_limits<uint64_t>::max());
  for (const char* text : {"0", "-1", "-9223372036854775808", "9223372036854775807", "9223372036854775808",
                           "18446744073709551615", "9007199254740993"}) {
    EXPECT_EQ(Parsed(text).toString(), text);
  }
}

TEST(JsonValueTest, RealNumbersKeepTheirValue) {
  for (const double number : {0.1, 1.0 / 3, -2.5e-300, 1.7976931348623157e308, 5e-324, 123456789.125, 1e21}) {
    const std::string text = JsonValue(number).toString();
    EXPECT_EQ(Parsed(text).asDouble(), number) << text;
    EXPECT_EQ(Parsed(text).toString(), text);
  }
}

TEST(JsonValueTest, AWholeRealNumberStaysReal) {
  EXPECT_EQ(Parsed(JsonValue(3.0).toString()).type(), Json::realValue);
}

TEST(JsonValueTest, TextsAreOneLineOfPlainUtf8) {
  JsonValue value(Json::objectValue);
  value["größe"] = "日本 😀";
  value["list"].append(1);
  value["list"].append(Json::nullValue);
  value["yes"] = true;
  EXPECT_EQ(value.toString(), "{\"größe\":\"日本 😀\",\"list\":[1,null],\"yes\":true}");
}

TEST(JsonValueTest, ControlCharactersAndQuotesAreEscaped) {
  const std::string text = "a\"b\\c\n\t\x01/\x7f";
  const std::string json = JsonValue(text).toString();
  EXPECT_EQ(json.find('\n'), std::string::npos);
  EXPECT_EQ(Parsed(json).asString(), text);
}

TEST(JsonValueTest, AStringMayHoldAZeroByte) {
  const std::string text("a\0b", 3);
  EXPECT_EQ(Parsed(JsonValue(text).toString()).asString(), text);
}

TEST(JsonValueTest, EscapesAreDecoded) { EXPECT_EQ(Parsed(R"("\u00e9\ud83d\ude00\n")").asString(), "é😀\n"); }

TEST(JsonValueTest, AThousandLevelsAreReadAndManyMoreAreNoDocument) {
  EXPECT_EQ(Parsed(Nested(1000)).toString(), Nested(1000));
  JsonValue value(7);
  EXPECT_FALSE(value.fromString(Nested(1001)));
  EXPECT_TRUE(value.isNull());
  for (const std::string& text : {Nested(100'000), std::string(100'000, '['), std::string(100'000, '{')}) {
    value = JsonValue(7);
    EXPECT_FALSE(value.fromString(text));
    EXPECT_TRUE(value.isNull());
  }
}

TEST(JsonValueTest, WhatIsNoDocumentLeavesNull) {
  for (const char* text : {"", " ", "{", "[1,", "{\"a\":}", "nul", "'a'", "[1 2]", "\"open", "{} {}", "1 x",
                           "[] trailing", "[1,]", "{\"a\":1,}", "{\"a\" 1}", "\"\\ud83d\""}) {
    JsonValue value;
    value["before"] = 1;
    EXPECT_FALSE(value.fromString(text)) << text;
    EXPECT_TRUE(value.isNull()) << text;
  }
}

TEST(JsonValueTest, AZeroByteBehindADocumentIsNotItsEnd) {
  using namespace std::string_literals;
  for (const std::string& text :
       {"{}\0"s, "{} \0"s, "[1]\0, and more"s, "17\0"s, "\"s\"\0"s, "null\0"s, "\0{}"s}) {
    JsonValue value(7);
    EXPECT_FALSE(value.fromString(text)) << text;
    EXPECT_TRUE(value.isNull()) << text;
  }
  EXPECT_EQ(Parsed("{\"a\":\"b\0\"}"s)["a"].asString(), "b\0"s);
}

TEST(JsonValueTest, BlanksAroundADocumentAreNoMatter) {
  EXPECT_EQ(Parsed(" \n\t {\"a\" : [ 1 , 2 ] } \r\n").toString(), "{\"a\":[1,2]}");
}

TEST(JsonValueTest, AnyKindOfValueIsADocument) {
  for (const char* text : {"null", "true", "false", "1", "\"s\"", "[]", "{}"}) {
    EXPECT_EQ(Parsed(text).toString(), text);
  }
}

TEST(JsonValueTest, ParsingReplacesWhatWasThere) {
  JsonValue value;
  value["before"] = 1;
  ASSERT_TRUE(value.fromString("{\"after\":2}"));
  EXPECT_EQ(value.toString(), "{\"after\":2}");
}

TEST(JsonValueTest, AFileIsReadAsAWhole) {
  const TemporaryFolder folder;
  WriteFile(folder / "büro.json", "{\"a\":\n [1,\"ü\"]}\n");
  JsonValue value;
  ASSERT_TRUE(value.fromFile(folder / "büro.json"));
  EXPECT_EQ(value.toString(), "{\"a\":[1,\"ü\"]}");
}

TEST(JsonValueTest, AFileThatIsMissingEmptyOrAFolderLeavesNull) {
  const TemporaryFolder folder;
  WriteFile(folder / "empty", "");
  for (const std::string& path : {folder / "missing", folder / "empty", folder.path(), std::string()}) {
    JsonValue value(7);
    EXPECT_FALSE(value.fromFile(path)) << path;
    EXPECT_TRUE(value.isNull()) << path;
  }
}

}  // namespace
}  // namespace vantrel::elastic
