// The requests of "search" and "dump", and the silence of "plugin".

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/json.h>

#include <memory>
#include <string>
#include <vector>

#include "tool/exchange.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;

Json::Value Parse(const std::string& text) {
  Json::CharReaderBuilder builder;
  Json::CharReaderBuilder::strictMode(&builder.settings_);
  builder["strictRoot"] = false;
  const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
  Json::Value value;
  std::string complaint;
  EXPECT_TRUE(reader->parse(text.data(), text.data() + text.size(), &value, &complaint)) << complaint << text;
  return value;
}

class RequestTest : public ExchangeTest {
 protected:
  // The one request of a run that goes well.
  std::string TextSent(const std::vector<std::string>& arguments) const {
    const Exchange exchange = Run(arguments);
    EXPECT_THAT(exchange.run, Printed("{\"success\":true}\n"));
    EXPECT_EQ(exchange.connections, 1);
    constexpr size_t kHeaderSize = 4;
    std::string request = exchange.sent.size() < kHeaderSize ? "" : exchange.sent.substr(kHeaderSize);
    EXPECT_TRUE(exchange.sent == Framed(request));
    return request;
  }

  // The order of members is no matter.
  Json::Value JsonSent(const std::vector<std::string>& arguments) const { return Parse(TextSent(arguments)); }
};

class SearchRequestTest : public RequestTest {
 protected:
  static std::vector<std::string> Search(const std::vector<std::string>& options) {
    std::vector<std::string> arguments{"-a", "search", "-I", "idx", "-q", "foo"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    return arguments;
  }

  // The request of a search for foo with some options more.
  Json::Value SentWith(const std::vector<std::string>& options) const { return JsonSent(Search(options)); }

  // The same without any.
  static Json::Value Plain() {
    return Parse(R"({"command": "search",
                     "data": {"indice": ["idx"], "query_string": {"query": "foo"}, "from": 0, "size": 10,
                              "filters": [{"name": "plugin", "data": {"name": "", "data": null}}]}})");
  }
  static Json::Value PlainButFilter(const std::string& plugin, const std::string& data) {
    Json::Value request = Plain();
    request["data"]["filters"][0]["data"]["name"] = plugin;
    request["data"]["filters"][0]["data"]["data"] = Parse(data);
    return request;
  }
  static Json::Value PlainButFields(const std::string& fields) {
    Json::Value request = Plain();
    request["data"]["load_field"] = Parse(fields);
    return request;
  }
};

TEST_F(SearchRequestTest, HoldsIndexQueryAndDefaults) { EXPECT_EQ(SentWith({}), Plain()); }

TEST_F(SearchRequestTest, HoldsEveryOptionInItsPlace) {
  EXPECT_EQ(SentWith({"-si", "25", "-o", "50", "-P", "category", "-D", R"({"is":["audio"]})", "-f",
                      R"(["id","title"])"}),
            Parse(R"({"command": "search",
                      "data": {"indice": ["idx"], "query_string": {"query": "foo"}, "from": 50, "size": 25,
                               "filters": [{"name": "plugin",
                                            "data": {"name": "category", "data": {"is": ["audio"]}}}],
                               "load_field": ["id", "title"]}})"));
}

TEST_F(SearchRequestTest, TakesTextsAsTheyAre) {
  const std::string odd = "\"quoted\" \\ [\"idx\"] {} späte 日本 😀 \n\t\x01\x7f, a OR b/*?~";
  Json::Value expected = PlainButFilter(odd, "null");
  expected["data"]["indice"][0] = odd;
  expected["data"]["query_string"]["query"] = odd;
  EXPECT_EQ(JsonSent({"-a", "search", "-I", odd, "-q", odd, "-P", odd}), expected);
}

TEST_F(SearchRequestTest, IsOneLine) {
  EXPECT_THAT(TextSent(Search({"-D", "{\n\"a\":\n1}", "-P", "two\nlines"})), Not(HasSubstr("\n")));
}

TEST_F(SearchRequestTest, KeepsSizeAndOffsetExactly) {
  for (const char* number :
       {"0", "1", "2147483648", "4294967296", "9007199254740993", "9223372036854775807"}) {
    Json::Value expected = Plain();
    expected["data"]["size"] = Parse(number);
    EXPECT_EQ(SentWith({"-si", number}), expected) << number;
    expected = Plain();
    expected["data"]["from"] = Parse(number);
    EXPECT_EQ(SentWith({"-o", number}), expected) << number;
  }
  EXPECT_THAT(TextSent(Search({"-si", "99999999999999999999"})), HasSubstr("\"size\":9223372036854775807"));
}

TEST_F(SearchRequestTest, IsNotBoundByTheMaximum) {
  Json::Value expected = Plain();
  expected["data"]["size"] = 2000;
  EXPECT_EQ(SentWith({"-m", "5", "-si", "2000", "-i", "-d", "/no/folder", "-t", "token", "-n", "3"}),
            expected);
}

TEST_F(SearchRequestTest, CarriesAnyJsonAsFilterData) {
  for (const char* data : {R"({"a":{"b":[1,-2.5,"x",null,true]},"":""})", "[]", "{}", "[[[1]]]", "\"text\"",
                           "17", "-9223372036854775808", "18446744073709551615", "0.1", "1e300", "true",
                           "null", " [ 1 ] ", R"("\u0000\ud83d\ude00")"}) {
    EXPECT_EQ(SentWith({"-P", "p", "-D", data}), PlainButFilter("p", data)) << data;
  }
}

TEST_F(SearchRequestTest, HasTheFilterWhateverIsGivenOfIt) {
  EXPECT_EQ(SentWith({"-D", R"({"a":1})"}), PlainButFilter("", R"({"a":1})"));
  EXPECT_EQ(SentWith({"-P", "p"}), PlainButFilter("p", "null"));
  EXPECT_EQ(SentWith({"-P", "", "-D", ""}), Plain());
}

TEST_F(SearchRequestTest, LoadsTheFieldsOfAnArray) {
  for (const char* fields :
       {R"(["id"])", R"(["id","größe","id"])", "[]", R"([1,null,{"a":[]}])", " [\n\"id\" ] "}) {
    EXPECT_EQ(SentWith({"-f", fields}), PlainButFields(fields)) << fields;
  }
}

TEST_F(SearchRequestTest, DropsFieldsThatAreNoArray) {
  for (const char* fields : {"", "id", "\"id\"", "17", "null", "true", R"({"0":"id"})", "[\"id\"",
                             "[\"id\"] x", "['id']", "[\"id\",]", "id,title", " "}) {
    EXPECT_EQ(SentWith({"-f", fields}), Plain()) << fields;
  }
  EXPECT_EQ(SentWith({"-f", std::string(60'000, '[') + std::string(60'000, ']')}), Plain());
}

TEST_F(SearchRequestTest, TakesTheLastOfRepeatedOptions) {
  EXPECT_EQ(SentWith({"-f", "[\"id\"]", "-f", "id", "-D", "{", "-D", "[1]", "-si", "-1", "-si", "10"}),
            PlainButFilter("", "[1]"));
}

TEST_F(SearchRequestTest, IsNotSentWhereACheckFails) {
  const auto rejected = [](const std::string& reason) {
    return SentNothing(Aborted("", "vantrel::Error", reason));
  };
  EXPECT_THAT(Run({"-a", "search"}), rejected("index is required."));
  EXPECT_THAT(Run({"-a", "search", "-q", "foo"}), rejected("index is required."));
  EXPECT_THAT(Run({"-a", "search", "-I", "idx"}), rejected("query string is required."));
  EXPECT_THAT(Run(Search({"-si", "-1"})), rejected("Invalid size."));
  EXPECT_THAT(Run(Search({"-o", "-5"})), rejected("Invalid offset."));
  for (const char* data : {"no json", "{", " ", "{} {}", "[1,]", "{'a':1}"}) {
    EXPECT_THAT(Run(Search({"-D", data})), rejected("Invalid filter data")) << data;
  }
  EXPECT_THAT(Run(Search({"-D", std::string(120'000, '[')})), rejected("Invalid filter data"));
  EXPECT_THAT(Run({"-a", "dump"}), rejected("index is required."));
}

TEST_F(SearchRequestTest, LeavesErrorsToTheDaemon) {
  const std::string error = R"({"success":false,"error":{"code":"index_not_found","reason":"no index idx"}})";
  EXPECT_THAT(Run(Search({}), std::vector<std::string>{error}).run, Printed(error + '\n'));
}

TEST_F(RequestTest, OfDumpHoldsTheIndexAlone) {
  EXPECT_EQ(JsonSent({"-a", "dump", "-I", "idx"}),
            Parse(R"({"command": "index_list", "data": {"id": "idx"}})"));
  EXPECT_EQ(JsonSent({"-a", "dump", "-I", "a\"b/ü", "-q", "foo",      "-si", "-1", "-o", "-1",
                      "-P", "p",    "-D", "{",      "-f", "[\"id\"]", "-st", "{}", "-p", "/no/file"}),
            Parse(R"({"command": "index_list", "data": {"id": "a\"b/ü"}})"));
}

TEST_F(RequestTest, OfPluginIsNone) {
  EXPECT_THAT(Run({"-a", "plugin"}), SentNothing(Printed("")));
  EXPECT_THAT(Run({"-a", "plugin", "-I", "idx", "-q", "foo", "-P", "p", "-D", "{}", "-st", "{}"}),
              SentNothing(Printed("")));
}

}  // namespace
}  // namespace quorelastic::testing
