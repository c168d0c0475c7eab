#include "elastic/search/plugin_data.h"

#include <algorithm>

#include "elastic/common/quoted.h"
#include "elastic/index/index_text.h"
#include "vantrel/elastic/search.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

PluginData::PluginData(const std::string& plugin, const char* expected, const Json::Value& data)
    : plugin_(plugin), expected_(expected), data_(data) {
  if (!data_.isObject()) Refuse("the data is no object");
}

const Json::Value& PluginData::Take(const char* name) {
  if (!data_.isMember(name)) Refuse("the data lacks the member " + Quoted(name));
  taken_.insert(name);
  return data_[name];
}

std::wstring PluginData::TakeText(const char* name) { return ToText(name, Take(name)); }

bool PluginData::TakeBool(const char* name, bool otherwise) {
  if (!Has(name)) return otherwise;
  const Json::Value& value = Take(name);
  if (!value.isBool()) Refuse("member " + Quoted(name) + " is neither true nor false");
  return value.asBool();
}

std::vector<std::wstring> PluginData::TakeTexts(const char* name, const SearchLimits& limits) {
  const Json::Value& values = Take(name);
  if (!values.isArray() || values.empty()) Refuse("member " + Quoted(name) + " is no array with texts in it");
  if (values.size() > limits.filter_values) {
    throw LimitExceededError(
        "filter_values", limits.filter_values,
        "the data of search plugin " + Quoted(plugin_) + " has " + std::to_string(values.size()) + " values");
  }
  std::vector<std::wstring> texts;
  for (const Json::Value& value : values) texts.push_back(ToText(name, value));
  return texts;
}

std::wstring PluginData::TakeField(const char* name, const IndexSettings& settings) {
  const std::wstring wide = TakeText(name);
  const std::string field = data_[name].asString();
  const bool is_known = std::any_of(settings.fields.begin(), settings.fields.end(),
                                    [&](const FieldSettings& known) { return known.name == field; });
  if (!is_known) Refuse("the index has no field " + Quoted(field));
  return wide;
}

std::wstring PluginData::ToText(const char* name, const Json::Value& value) const {
  if (!value.isString()) Refuse("member " + Quoted(name) + " holds what is no text");
  std::wstring wide;
  if (const char* problem = ToIndexText(value.asString(), wide)) {
    Refuse("a text of member " + Quoted(name) + " " + problem);
  }
  return wide;
}

void PluginData::RefuseOthers() const {
  for (const std::string& name : data_.getMemberNames()) {
    if (!taken_.contains(name)) Refuse("the data has the unknown member " + Quoted(name));
  }
}

void PluginData::Refuse(const std::string& problem) const {
  throw PluginDataError(plugin_, problem + "; expected is " + expected_);
}

}  // namespace vantrel::elastic
