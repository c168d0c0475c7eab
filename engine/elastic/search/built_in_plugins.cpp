#include "elastic/search/built_in_plugins.h"

#include <algorithm>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "elastic/search/field_filter.h"
#include "elastic/search/plugin_data.h"
#include "elastic/search/range_filter.h"
#include "vantrel/elastic/file_category.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;
using Lucene::StringUtils;

// What the built-in plugins have in common: their name and the data they expect stand in one place.
class BuiltInPlugin : public SearchPlugin {
 public:
  BuiltInPlugin(const char* name, const char* meaning, const char* expected)
      : name_(name), meaning_(meaning), expected_(expected) {}

  std::string name() const override { return name_; }
  std::string summary() const override { return std::string(meaning_) + ": " + expected_; }

  Lucene::FilterPtr MakeFilter(const SearchPluginContext& context, const Json::Value& data) const override {
    PluginData taken(name_, expected_, data);
    return Make(context, taken);
  }

 private:
  virtual Lucene::FilterPtr Make(const SearchPluginContext& context, PluginData& data) const = 0;

  const char* name_;
  const char* meaning_;
  const char* expected_;
};

class TermPlugin : public BuiltInPlugin {
 public:
  TermPlugin()
      : BuiltInPlugin("term", "the field holds one of the values",
                      R"({"field": name of a field, "values": [text, ...]})") {}

 private:
  Lucene::FilterPtr Make(const SearchPluginContext& context, PluginData& data) const override {
    const std::wstring field = data.TakeField("field", context.settings);
    const std::vector<std::wstring> values = data.TakeTexts("values", context.limits);
    data.RefuseOthers();
    return newLucene<TermsFilter>(field, values);
  }
};

class IdsPlugin : public BuiltInPlugin {
 public:
  IdsPlugin()
      : BuiltInPlugin("ids", "the document's id is one of the values", R"({"values": [text, ...]})") {}

 private:
  Lucene::FilterPtr Make(const SearchPluginContext& context, PluginData& data) const override {
    const std::vector<std::wstring> values = data.TakeTexts("values", context.limits);
    data.RefuseOthers();
    return newLucene<TermsFilter>(StringUtils::toUnicode(context.settings.id_field), values);
  }
};

class RangePlugin : public BuiltInPlugin {
 public:
  RangePlugin()
      : BuiltInPlugin(
            "range", "the field holds a value between the bounds",
            R"({"field": name of a field, "from": bound, "to": bound, "include_lower": true or false, )"
            R"("include_upper": true or false, "numeric": true or false}, where "from" or "to" and all from )"
            R"("include_lower" on may be missing, and a bound is a text or, with "numeric", a number)") {}

 private:
  Lucene::FilterPtr Make(const SearchPluginContext& context, PluginData& data) const override {
    const std::wstring field = data.TakeField("field", context.settings);
    const bool includes_lower = data.TakeBool("include_lower", true);
    const bool includes_upper = data.TakeBool("include_upper", true);
    const bool numeric = data.TakeBool("numeric", false);
    if (!data.Has("from") && !data.Has("to")) data.Refuse("there is neither \"from\" nor \"to\"");
    if (numeric) {
      const Range<Number> range{TakeNumber(data, "from"), TakeNumber(data, "to"), includes_lower,
                                includes_upper};
      data.RefuseOthers();
      return NewNumberRangeFilter(field, range);
    }
    const Range<std::wstring> range{TakeBound(data, "from"), TakeBound(data, "to"), includes_lower,
                                    includes_upper};
    data.RefuseOthers();
    return NewTextRangeFilter(field, range);
  }

  static std::optional<std::wstring> TakeBound(PluginData& data, const char* name) {
    if (!data.Has(name)) return std::nullopt;
    return data.TakeText(name);
  }

  static std::optional<Number> TakeNumber(PluginData& data, const char* name) {
    if (!data.Has(name)) return std::nullopt;
    const Json::Value& bound = data.Take(name);
    if (bound.isInt64()) return static_cast<Number>(bound.asInt64());
    if (bound.isUInt64()) return static_cast<Number>(bound.asUInt64());
    if (bound.isNumeric()) return static_cast<Number>(bound.asDouble());
    const std::optional<Number> number = ParseNumber(data.ToText(name, bound));
    if (!number.has_value()) data.Refuse("member \"" + std::string(name) + "\" is no number");
    return number;
  }
};

class CategoryPlugin : public BuiltInPlugin {
 public:
  CategoryPlugin()
      : BuiltInPlugin("category", "the field is the file name extension of a file category",
                      R"({"field": name of a field, "category": "document", "audio", "video" or "image"})") {}

 private:
  Lucene::FilterPtr Make(const SearchPluginContext& context, PluginData& data) const override {
    const std::wstring field = data.TakeField("field", context.settings);
    const std::string wanted = StringUtils::toUTF8(data.TakeText("category"));
    data.RefuseOthers();
    for (const FileCategory& category : kFileCategories) {
      if (category.name == wanted) {
        return newLucene<TermsFilter>(field, Extensions(category.extensions));
      }
    }
    data.Refuse("member \"category\" is no category");
  }

  // The extensions of a query, in lower and in upper case.
  static std::vector<std::wstring> Extensions(std::string_view query) {
    constexpr std::string_view kBetween = " OR ";
    std::vector<std::wstring> extensions;
    for (size_t begin = 0; begin < query.size();) {
      const size_t end = std::min(query.find(kBetween, begin), query.size());
      std::wstring lower(query.begin() + static_cast<std::ptrdiff_t>(begin),
                         query.begin() + static_cast<std::ptrdiff_t>(end));
      std::wstring upper = lower;
      for (wchar_t& letter : upper) {
        if (letter >= L'a' && letter <= L'z') letter += L'A' - L'a';
      }
      extensions.push_back(std::move(lower));
      extensions.push_back(std::move(upper));
      begin = end + kBetween.size();
    }
    return extensions;
  }
};

}  // namespace

std::vector<std::shared_ptr<const SearchPlugin>> MakeBuiltInPlugins() {
  return {std::make_shared<TermPlugin>(), std::make_shared<IdsPlugin>(), std::make_shared<RangePlugin>(),
          std::make_shared<CategoryPlugin>()};
}

}  // namespace vantrel::elastic
