#include "vantrel/elastic/json_value.h"

#include <json/reader.h>
#include <json/writer.h>

#include <fstream>
#include <memory>
#include <sstream>

namespace vantrel::elastic {
namespace {

// Making these takes longer than a short document; made once, they are only read.
const Json::CharReaderBuilder& Readers() {
  static const Json::CharReaderBuilder builder = [] {
    Json::CharReaderBuilder made;
    made["collectComments"] = false;
    made["allowTrailingCommas"] = false;
    made["failIfExtra"] = true;
    made["stackLimit"] = 1000;
    return made;
  }();
  return builder;
}

const Json::StreamWriterBuilder& Writers() {
  static const Json::StreamWriterBuilder builder = [] {
    Json::StreamWriterBuilder made;
    made["indentation"] = "";
    made["emitUTF8"] = true;
    return made;
  }();
  return builder;
}

}  // namespace

bool JsonValue::fromString(const std::string& text) {
  bool parsed = false;
  try {
    // To the library, a zero byte behind the document is the end of the text, whatever follows.
    const std::unique_ptr<Json::CharReader> reader(Readers().newCharReader());
    parsed = reader->parse(text.data(), text.data() + text.size(), this, nullptr) &&
             text.find('\0', static_cast<size_t>(getOffsetLimit())) == std::string::npos;
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

std::string JsonValue::toString() const { return Json::writeString(Writers(), *this); }

}  // namespace vantrel::elastic
