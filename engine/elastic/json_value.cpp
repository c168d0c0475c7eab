#include "vantrel/elastic/json_value.h"

#include <json/reader.h>
#include <json/writer.h>

#include <fstream>
#include <memory>
#include <sstream>

namespace vantrel::elastic {

bool JsonValue::fromString(const std::string& text) {
  Json::CharReaderBuilder builder;
  builder["collectComments"] = false;
  builder["allowTrailingCommas"] = false;
  builder["failIfExtra"] = true;
  builder["stackLimit"] = 1000;
  bool parsed = false;
  try {
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    parsed = reader->parse(text.data(), text.data() + text.size(), this, nullptr);
  } catch (const Json::Exception&) {
    // The library throws, rather than answers false, where a document is nested too deep.
  }
  if (!parsed) Json::Value::operator=(Json::Value());
  return parsed;
}

bool JsonValue::fromFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  std::ostringstream text;
  text << file.rdbuf();
  if (!file.is_open() || file.bad()) {
    Json::Value::operator=(Json::Value());
    return false;
  }
  return fromString(text.str());
}

std::string JsonValue::toString() const {
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "";
  builder["emitUTF8"] = true;
  return Json::writeString(builder, *this);
}

}  // namespace vantrel::elastic
