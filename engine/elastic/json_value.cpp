#include "vantrel/elastic/json_value.h"

#include <json/reader.h>
#include <json/writer.h>

#include <exception>
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
    // To the library, a zero byte behind the document is the end of the text, whatever follows.
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    parsed = reader->parse(text.data(), text.data() + text.size(), this, nullptr) &&
             text.find('\0', static_cast<size_t>(getOffsetLimit())) == std::string::npos;
  } catch (const std::exception&) {
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
