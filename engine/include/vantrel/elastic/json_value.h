#pragma once

#include <json/value.h>

#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// A JSON value with three operations on whole texts. Nothing here throws for bad input.
class VANTREL_ELASTIC_EXPORT JsonValue : public Json::Value {
 public:
  using Json::Value::Value;

  // Parses one JSON document, with nothing but blanks and comments around it. False where the text is no such
  // document or is nested deeper than 1000 levels; the value is null then.
  bool fromString(const std::string& text);

  // The same for what a file holds; false also where it cannot be read.
  bool fromFile(const std::string& path);

  // The value on one line, without blanks, in UTF-8 and with no newline at the end. Numbers keep their value.
  std::string toString() const;
};

}  // namespace vantrel::elastic
