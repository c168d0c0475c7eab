#include "commands/settings_json.h"

#include <algorithm>
#include <string>
#include <vector>

#include "base/limits.h"
#include "vantrel/elastic/setting_words.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::FieldSettings;
using vantrel::elastic::IndexSettings;
using vantrel::elastic::kFieldTypeWords;
using vantrel::elastic::kTermVectorWords;
using vantrel::elastic::ToWord;

template <typename Table>
Shape ChoiceOf(const Table& table) {
  std::vector<std::string> words;
  words.reserve(table.size());
  for (const auto& entry : table) words.emplace_back(entry.word);
  return Choice(std::move(words));
}

template <typename Table>
auto FromWord(const Table& table, const std::string& word) {
  return std::find_if(table.begin(), table.end(), [&](const auto& entry) { return entry.word == word; })
      ->value;
}

FieldSettings ToField(const Json::Value& json) {
  FieldSettings field;
  field.name = json["name"].asString();
  field.type = FromWord(kFieldTypeWords, json["type"].asString());
  field.stored = json.get("stored", field.stored).asBool();
  field.term_vector = FromWord(kTermVectorWords, json.get("term_vector", "none").asString());
  field.norms = json.get("norms", field.norms).asBool();
  field.frequencies = json.get("frequencies", field.frequencies).asBool();
  for (const Json::Value& step : json["pre_processors"]) {
    field.pre_processors.push_back({step["name"].asString(), step.get("argument", "").asString()});
  }
  return field;
}

}  // namespace

Shape SettingsShape() {
  const Shape step = Object({
      {"name", true, Choice({"tolower", "ngram"}), "Lower case, or the runs of so many characters."},
      {"argument", false, Text(), "Of ngram: the lengths, such as \"2\" or \"2,3\"."},
  });
  const Shape field = Object({
      {"name", true, String(kLongestFieldName), "The field's name."},
      {"type", true, ChoiceOf(kFieldTypeWords),
       "A text is cut into words, lower-cased, each of them a term; a keyword is one term as it is."},
      {"stored", false, Boolean(), "Whether a search can hand back the values; true by default."},
      {"term_vector", false, ChoiceOf(kTermVectorWords),
       "What is kept about the terms of each single document; none by default."},
      {"norms", false, Boolean(), "Whether short values score higher; true by default."},
      {"frequencies", false, Boolean(),
       "Whether it is kept how often and where a term stands, which phrases need; true by default."},
      {"pre_processors", false, ArrayOf(step, kMostPreProcessors),
       "What the words of a text, or a keyword as a whole, go through before they become terms; none by "
       "default."},
  });
  return Object({
      {"fields", true, NonEmptyArrayOf(field, kMostFields), "The fields that documents may have."},
      {"id_field", false, String(kLongestFieldName),
       "The stored keyword that tells documents apart, \"id\" by default; added where the fields lack it."},
  });
}

IndexSettings ToSettings(const Json::Value& json) {
  IndexSettings settings;
  for (const Json::Value& field : json["fields"]) settings.fields.push_back(ToField(field));
  settings.id_field = json.get("id_field", settings.id_field).asString();
  return settings;
}

Json::Value ToJson(const IndexSettings& settings) {
  Json::Value json(Json::objectValue);
  json["id_field"] = settings.id_field;
  json["fields"] = Json::arrayValue;
  for (const FieldSettings& field : settings.fields) {
    Json::Value& object = json["fields"].append(Json::objectValue);
    object["name"] = field.name;
    object["type"] = ToWord(kFieldTypeWords, field.type);
    object["stored"] = field.stored;
    object["term_vector"] = ToWord(kTermVectorWords, field.term_vector);
    object["norms"] = field.norms;
    object["frequencies"] = field.frequencies;
    for (const auto& step : field.pre_processors) {
      Json::Value& described = object["pre_processors"].append(Json::objectValue);
      described["name"] = step.name;
      if (!step.argument.empty()) described["argument"] = step.argument;
    }
  }
  return json;
}

}  // namespace quorelasticd
