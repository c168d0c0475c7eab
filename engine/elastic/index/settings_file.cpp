#include "elastic/index/settings_file.h"

#include <cstddef>
#include <optional>
#include <set>
#include <span>
#include <stdexcept>
#include <string_view>
#include <utility>
#include <vector>

#include "elastic/common/durable_file.h"
#include "elastic/common/path.h"
#include "elastic/common/quoted.h"
#include "elastic/format/io/folder.h"
#include "elastic/index/index_text.h"
#include "elastic/preproc/pre_proc_chain.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/json_value.h"
#include "vantrel/elastic/setting_words.h"

namespace vantrel::elastic {
namespace {

constexpr int kSettingsVersion = 1;
constexpr uint64_t kLargestFile = uint64_t{16} << 20;

// One JSON object of the file. Members are taken one by one; what is left over at the end was unknown.
class SettingsObject {
 public:
  SettingsObject(const std::string& path, const Json::Value& object, std::string where)
      : path_(path), object_(object), where_(std::move(where)) {
    if (!object_.isObject()) Refuse("is no object");
  }

  bool Has(const char* name) const { return object_.isMember(name); }

  const Json::Value& Take(const char* name) {
    if (!object_.isMember(name)) Refuse("lacks the member " + Quoted(name));
    taken_.insert(name);
    return object_[name];
  }

  bool TakeBool(const char* name) {
    const Json::Value& value = Take(name);
    if (!value.isBool()) Refuse(std::string("member ") + Quoted(name) + " is neither true nor false");
    return value.asBool();
  }

  std::string TakeString(const char* name) {
    const Json::Value& value = Take(name);
    if (!value.isString()) Refuse(std::string("member ") + Quoted(name) + " is no string");
    return value.asString();
  }

  template <typename Table>
  auto TakeWord(const char* name, const Table& table) {
    const std::string word = TakeString(name);
    for (const auto& entry : table) {
      if (entry.word == word) return entry.value;
    }
    Refuse(std::string("member ") + Quoted(name) + " has the unknown value " + Quoted(word));
  }

  void RefuseOthers() const {
    for (const std::string& name : object_.getMemberNames()) {
      if (!taken_.contains(name)) Refuse("has the unknown member " + Quoted(name));
    }
  }

  [[noreturn]] void Refuse(const std::string& problem) const {
    throw IndexError(path_, where_ + " " + problem);
  }

 private:
  const std::string& path_;
  const Json::Value& object_;
  std::string where_;
  std::set<std::string> taken_;
};

PreProcSettings ReadPreProcessor(const std::string& path, const Json::Value& value, size_t field_number) {
  SettingsObject object(path, value, "pre-processor of field " + std::to_string(field_number));
  PreProcSettings step;
  step.name = object.TakeString("name");
  step.argument = object.TakeString("argument");
  object.RefuseOthers();
  return step;
}

FieldSettings ReadField(const std::string& path, const Json::Value& value, size_t number) {
  SettingsObject object(path, value, "field " + std::to_string(number));
  FieldSettings field;
  field.name = object.TakeString("name");
  field.type = object.TakeWord("type", kFieldTypeWords);
  field.stored = object.TakeBool("stored");
  field.term_vector = object.TakeWord("term_vector", kTermVectorWords);
  field.norms = object.TakeBool("norms");
  field.frequencies = object.TakeBool("frequencies");
  if (object.Has("pre_processors")) {
    const Json::Value& steps = object.Take("pre_processors");
    if (!steps.isArray()) object.Refuse("member \"pre_processors\" is no array");
    for (const Json::Value& step : steps)
      field.pre_processors.push_back(ReadPreProcessor(path, step, number));
  }
  object.RefuseOthers();
  return field;
}

std::string ReadWholeFile(const std::string& folder) {
  const auto file = format::DiskFolder(folder).Open(kSettingsFileName);
  if (file->size() > kLargestFile) throw IndexError(file->name(), "too large for a settings file");
  std::string text(file->size(), '\0');
  file->ReadAt(0, std::span(reinterpret_cast<uint8_t*>(text.data()), text.size()));
  return text;
}

// What is wrong, if anything is. Whose fault that is depends on where the settings are from.
using Problem = std::optional<std::string>;

Problem FindIdFieldProblem(const IndexSettings& settings) {
  for (const FieldSettings& field : settings.fields) {
    if (field.name != settings.id_field) continue;
    if (!field.pre_processors.empty()) return "the id field " + Quoted(field.name) + " has pre-processors";
    if (field.type == FieldType::kKeyword && field.stored) return std::nullopt;
    return "the id field " + Quoted(field.name) + " is no stored keyword";
  }
  return "the settings lack the id field " + Quoted(settings.id_field);
}

Problem FindPreProcessorProblem(const FieldSettings& field) {
  try {
    BuildPreProcChain(field.pre_processors);
  } catch (const std::invalid_argument& error) {
    return "field " + Quoted(field.name) + ": " + error.what();
  }
  if (field.frequencies || !MakesPhrases(field.pre_processors)) return std::nullopt;
  return "field " + Quoted(field.name) +
         ": \"ngram\" needs frequencies: a word is found as a phrase of its grams";
}

Problem FindProblem(const IndexSettings& settings) {
  if (settings.fields.empty()) return "the settings have no field";
  std::set<std::string_view> names;
  for (const FieldSettings& field : settings.fields) {
    if (field.name.empty()) return "the settings have a field without a name";
    std::wstring wide;
    if (const char* problem = ToIndexText(field.name, wide))
      return "the field name " + Quoted(field.name) + " " + problem;
    if (!names.insert(field.name).second)
      return "the settings have two fields of the name " + Quoted(field.name);
    if (Problem problem = FindPreProcessorProblem(field)) return problem;
  }
  return FindIdFieldProblem(settings);
}

}  // namespace

void CheckSettings(const std::string& folder, const IndexSettings& settings) {
  if (const Problem problem = FindProblem(settings)) throw IndexValueError(folder, *problem);
}

void WriteSettings(const std::string& folder, const IndexSettings& settings) {
  JsonValue root(Json::objectValue);
  root["version"] = kSettingsVersion;
  root["compound_files"] = settings.compound_files;
  root["id_field"] = settings.id_field;
  root["fields"] = Json::arrayValue;
  for (const FieldSettings& field : settings.fields) {
    Json::Value& object = root["fields"].append(Json::objectValue);
    object["name"] = field.name;
    object["type"] = ToWord(kFieldTypeWords, field.type);
    object["stored"] = field.stored;
    object["term_vector"] = ToWord(kTermVectorWords, field.term_vector);
    object["norms"] = field.norms;
    object["frequencies"] = field.frequencies;
    for (const PreProcSettings& step : field.pre_processors) {
      Json::Value& step_object = object["pre_processors"].append(Json::objectValue);
      step_object["name"] = step.name;
      step_object["argument"] = step.argument;
    }
  }
  WriteFileDurably(folder, kSettingsFileName, root.toString() + "\n");
}

IndexSettings ReadSettings(const std::string& folder) {
  const std::string path = JoinPath(folder, kSettingsFileName);
  JsonValue root;
  if (!root.fromString(ReadWholeFile(folder))) throw IndexError(path, "the settings are no JSON document");
  SettingsObject object(path, root, "settings file");
  const Json::Value& version = object.Take("version");
  if (!version.isInt() || version.asInt() != kSettingsVersion) object.Refuse("is of an unknown version");
  IndexSettings settings;
  settings.compound_files = object.TakeBool("compound_files");
  settings.id_field = object.TakeString("id_field");
  const Json::Value& fields = object.Take("fields");
  if (!fields.isArray()) object.Refuse("member \"fields\" is no array");
  for (const Json::Value& field : fields) {
    settings.fields.push_back(ReadField(path, field, settings.fields.size() + 1));
  }
  object.RefuseOthers();
  if (const Problem problem = FindProblem(settings)) throw IndexError(path, *problem);
  return settings;
}

}  // namespace vantrel::elastic
