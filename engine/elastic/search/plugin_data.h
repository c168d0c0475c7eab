#pragma once

#include <json/value.h>

#include <set>
#include <string>
#include <vector>

#include "vantrel/elastic/search_plugin.h"

namespace vantrel::elastic {

// The JSON object that a built-in plugin takes. Members are taken one by one; what is left over at the end was
// unknown. Everything throws PluginDataError that says what the whole was expected to be.
class PluginData {
 public:
  // `expected` describes the object in one line; these live as long as this does.
  PluginData(const std::string& plugin, const char* expected, const Json::Value& data);

  bool Has(const char* name) const { return data_.isMember(name); }

  const Json::Value& Take(const char* name);

  // Texts are valid for the index.
  std::wstring TakeText(const char* name);
  bool TakeBool(const char* name, bool otherwise);

  // One or more texts; LimitExceededError for limits.filter_values.
  std::vector<std::wstring> TakeTexts(const char* name, const SearchLimits& limits);

  // The name of a field of the index.
  std::wstring TakeField(const char* name, const IndexSettings& settings);

  std::wstring ToText(const char* name, const Json::Value& value) const;
  void RefuseOthers() const;
  [[noreturn]] void Refuse(const std::string& problem) const;

 private:
  const std::string plugin_;
  const char* expected_;
  const Json::Value& data_;
  std::set<std::string> taken_;
};

}  // namespace vantrel::elastic
