#include "vantrel/elastic/search_plugin.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include "search_fixture.h"
#include "vantrel/elastic/file_category.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::Filter;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Request;
using ::quorelastic::testing::Thrown;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;

class SearchPluginTest : public ::testing::Test {
 protected:
  SearchPluginTest()
      : index_({{.name = "body"},
                {.name = "kind", .type = FieldType::kKeyword},
                {.name = "size", .type = FieldType::kKeyword}}) {
    index_.Add({"id=report", "body=one", "kind=pdf", "size=9"});
    index_.Add({"id=photo", "body=two", "kind=JPG", "size=100"});
    index_.Add({"id=film", "body=one two", "kind=dvr-ms", "size=-2.5"});
    index_.Add({"id=song", "body=three", "kind=mp3", "size=1e3"});
    index_.Add({"id=other", "body=one", "kind=zip", "size=big", "size=12"});
  }

  std::vector<std::string> Keep(const std::string& plugin, const std::string& data) const {
    return index_.Find("*:*", {Filter(plugin, data)});
  }

  std::string Problem(const std::string& plugin, const std::string& data) const {
    const auto error = Thrown<PluginDataError>([&] { Keep(plugin, data); });
    EXPECT_EQ(error.plugin(), plugin);
    EXPECT_THAT(error.what(), StartsWith("search plugin \"" + plugin + "\": "));
    EXPECT_THAT(error.what(), HasSubstr("; expected is {"));
    return error.what();
  }

  OwnIndex index_;
};

TEST_F(SearchPluginTest, TermKeepsTheDocumentsWithOneOfTheValues) {
  EXPECT_THAT(Keep("term", R"({"field":"kind","values":["pdf","zip","nothing"]})"),
              ElementsAre("other", "report"));
  EXPECT_THAT(Keep("term", R"({"field":"kind","values":["PDF"]})"), IsEmpty());
  EXPECT_THAT(Keep("term", R"({"field":"body","values":["two"]})"), ElementsAre("film", "photo"));
}

TEST_F(SearchPluginTest, IdsKeepsTheDocumentsWithOneOfTheIds) {
  EXPECT_THAT(Keep("ids", R"({"values":["song","film","song","?"]})"), ElementsAre("film", "song"));
}

TEST_F(SearchPluginTest, RangeComparesTexts) {
  EXPECT_THAT(Keep("range", R"({"field":"size","from":"100","to":"12"})"), ElementsAre("other", "photo"));
  EXPECT_THAT(Keep("range", R"({"field":"size","from":"100","to":"12","include_upper":false})"),
              ElementsAre("photo"));
  EXPECT_THAT(Keep("range", R"({"field":"size","from":"100","to":"12","include_lower":false})"),
              ElementsAre("other"));
  EXPECT_THAT(Keep("range", R"({"field":"size","from":"9"})"), ElementsAre("other", "report"));
  EXPECT_THAT(Keep("range", R"({"field":"size","to":"0"})"), ElementsAre("film"));
  EXPECT_THAT(Keep("range", R"({"field":"size","from":"b","to":"a"})"), IsEmpty());
}

TEST_F(SearchPluginTest, RangeComparesNumbersWhereToldTo) {
  EXPECT_THAT(Keep("range", R"({"field":"size","from":9,"to":100,"numeric":true})"),
              ElementsAre("other", "photo", "report"));
  EXPECT_THAT(Keep("range", R"({"field":"size","from":9,"to":100,"numeric":true,"include_lower":false,)"
                            R"("include_upper":false})"),
              ElementsAre("other"));
  EXPECT_THAT(Keep("range", R"({"field":"size","to":"-2.50","numeric":true})"), ElementsAre("film"));
  EXPECT_THAT(Keep("range", R"({"field":"size","from":999.5,"numeric":true})"), ElementsAre("song"));
}

TEST_F(SearchPluginTest, RangeTellsTheLargestIntegersApart) {
  OwnIndex index({{.name = "n", .type = FieldType::kKeyword}});
  index.Add({"id=a", "n=9223372036854775806"});
  index.Add({"id=b", "n=9223372036854775807"});
  EXPECT_THAT(
      index.Find("*", {Filter("range", R"({"field":"n","from":9223372036854775807,"numeric":true})")}),
      ElementsAre("b"));
  EXPECT_THAT(
      index.Find("*", {Filter("range", R"({"field":"n","to":"9223372036854775806","numeric":true})")}),
      ElementsAre("a"));
}

TEST_F(SearchPluginTest, CategoryKeepsTheDocumentsOfAKindOfFiles) {
  EXPECT_THAT(Keep("category", R"({"field":"kind","category":"document"})"), ElementsAre("report"));
  EXPECT_THAT(Keep("category", R"({"field":"kind","category":"image"})"), ElementsAre("photo"));
  EXPECT_THAT(Keep("category", R"({"field":"kind","category":"video"})"), ElementsAre("film"));
  EXPECT_THAT(Keep("category", R"({"field":"kind","category":"audio"})"), ElementsAre("song"));
}

TEST_F(SearchPluginTest, EveryExtensionOfACategoryIsOfIt) {
  for (const FileCategory& category : kFileCategories) {
    OwnIndex index({{.name = "kind", .type = FieldType::kKeyword}});
    size_t count = 0;
    for (size_t begin = 0; begin < category.extensions.size(); ++count) {
      const size_t end = std::min(category.extensions.find(' ', begin), category.extensions.size());
      const std::string extension(category.extensions.substr(begin, end - begin));
      index->Add({{{"id", std::to_string(count)}, {"kind", extension}}});
      begin = end + 4;
    }
    index->Commit();
    SearchRequest request = Request("*:*");
    request.filters = {
        Filter("category", R"({"field":"kind","category":")" + std::string(category.name) + R"("})")};
    EXPECT_EQ(index->Search(request).total, count) << category.name;
    EXPECT_GE(count, 25U);
  }
}

TEST_F(SearchPluginTest, DataOfTheWrongShapeIsRefusedWithWhatWasExpected) {
  for (const char* plugin : {"term", "ids", "range", "category"}) {
    for (const char* data : {"null", "[]", "7", "\"field\""}) {
      EXPECT_THAT(Problem(plugin, data), HasSubstr("the data is no object"));
    }
    EXPECT_THAT(Problem(plugin, "{}"), HasSubstr("the data lacks the member"));
  }
  EXPECT_THAT(Problem("term", R"({"field":"kind","values":[]})"), HasSubstr("no array with texts in it"));
  EXPECT_THAT(Problem("term", R"({"field":"kind","values":"pdf"})"), HasSubstr("no array with texts in it"));
  EXPECT_THAT(Problem("term", R"({"field":"kind","values":["pdf",7]})"), HasSubstr("holds what is no text"));
  EXPECT_THAT(Problem("term", R"({"field":"colour","values":["red"]})"), HasSubstr("no field \"colour\""));
  EXPECT_THAT(Problem("term", R"({"field":["kind"],"values":["red"]})"), HasSubstr("holds what is no text"));
  EXPECT_THAT(Problem("term", R"({"field":"kind","values":["pdf"],"value":1})"),
              HasSubstr("unknown member \"value\""));
  EXPECT_THAT(Problem("ids", R"({"values":["a"],"field":"id"})"), HasSubstr("unknown member \"field\""));
  EXPECT_THAT(Problem("range", R"({"field":"size"})"), HasSubstr("neither \"from\" nor \"to\""));
  EXPECT_THAT(Problem("range", R"({"field":"size","from":1})"), HasSubstr("holds what is no text"));
  EXPECT_THAT(Problem("range", R"({"field":"size","from":"x","numeric":true})"), HasSubstr("is no number"));
  for (const char* number : {"\"\"", "\" 1\"", "\"1 \"", "\"0x10\"", "\"nan\"", "\"inf\"", "\"١\""}) {
    EXPECT_THAT(Problem("range", std::string(R"({"field":"size","numeric":true,"to":)") + number + "}"),
                HasSubstr("is no number"))
        << number;
  }
  EXPECT_THAT(Problem("range", R"({"field":"size","from":"1","include_lower":1})"),
              HasSubstr("neither true nor false"));
  EXPECT_THAT(Problem("category", R"({"field":"kind","category":"music"})"), HasSubstr("is no category"));
}

TEST_F(SearchPluginTest, TextsThatNoIndexHoldsAreRefused) {
  SearchRequest request = Request("*:*");
  request.filters = {Filter("ids", R"({"values":["a"]})")};
  request.filters[0].data["values"][0] = "\xff";
  EXPECT_THAT(Thrown<PluginDataError>([&] { index_->Search(request); }).what(), HasSubstr("not valid UTF-8"));
}

TEST_F(SearchPluginTest, TooManyValuesOrFiltersAreRefused) {
  SearchLimits limits;
  limits.filter_values = 2;
  limits.filters = 1;
  SearchRequest request = Request("*:*");
  const auto limit = [&] {
    return Thrown<LimitExceededError>(
               [&] { index_->Search(request, SearchPluginRegistry::BuiltIn(), limits); })
        .limit();
  };
  request.filters = {Filter("ids", R"({"values":["a","b","c"]})")};
  EXPECT_EQ(limit(), "filter_values");
  request.filters = {Filter("ids", R"({"values":["film","song"]})")};
  EXPECT_EQ(index_->Search(request, SearchPluginRegistry::BuiltIn(), limits).total, 2U);
  request.filters.push_back(request.filters[0]);
  EXPECT_EQ(limit(), "filters");
}

TEST_F(SearchPluginTest, AnUnknownPluginIsNamedAndAnEmptyNameIsNoFilter) {
  EXPECT_EQ(Thrown<UnknownPluginError>([&] { Keep("magic", "{}"); }).plugin(), "magic");
  EXPECT_EQ(Keep("", "{}").size(), 5U);
  EXPECT_EQ(Keep("", "7").size(), 5U);
}

class NothingPlugin : public SearchPlugin {
 public:
  explicit NothingPlugin(std::string name) : name_(std::move(name)) {}
  std::string name() const override { return name_; }
  std::string summary() const override { return "makes no filter"; }
  Lucene::FilterPtr MakeFilter(const SearchPluginContext&, const Json::Value&) const override { return {}; }

 private:
  std::string name_;
};

TEST_F(SearchPluginTest, ARegistryListsItsPluginsByName) {
  SearchPluginRegistry registry;
  registry.Add(std::make_shared<NothingPlugin>("nothing"));
  std::vector<std::string> names;
  for (const auto& plugin : registry.List()) {
    names.push_back(plugin->name());
    EXPECT_NE(plugin->summary(), "");
    EXPECT_EQ(registry.Find(plugin->name()), plugin);
  }
  EXPECT_THAT(names, ElementsAre("category", "ids", "nothing", "range", "term"));
  EXPECT_EQ(registry.Find("none"), nullptr);
  EXPECT_EQ(SearchPluginRegistry::BuiltIn().List().size(), 4U);
}

TEST_F(SearchPluginTest, ANameIsTakenOnceAndNotEmpty) {
  SearchPluginRegistry registry;
  EXPECT_THROW(registry.Add(std::make_shared<NothingPlugin>("term")), PluginLoadError);
  EXPECT_THROW(registry.Add(std::make_shared<NothingPlugin>("")), PluginLoadError);
  EXPECT_EQ(registry.List().size(), 4U);
}

TEST_F(SearchPluginTest, APluginThatMakesNoFilterIsAnError) {
  SearchPluginRegistry registry;
  registry.Add(std::make_shared<NothingPlugin>("nothing"));
  SearchRequest request = Request("*:*");
  request.filters = {Filter("nothing", "{}")};
  EXPECT_THROW(index_->Search(request, registry), PluginDataError);
}

}  // namespace
}  // namespace vantrel::elastic
