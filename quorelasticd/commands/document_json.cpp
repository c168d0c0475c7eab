#include "commands/document_json.h"

#include <string>

#include "base/text.h"
#include "errors/request_error.h"

namespace quorelasticd {
namespace {

[[noreturn]] void RefuseDocument(const std::string& problem) {
  throw RequestError(ErrorCode::kBadRequest, problem);
}

[[noreturn]] void RefuseValue(const std::string& field) {
  RefuseDocument("field " + Quoted(field) + ": expected a string or an array of strings");
}

}  // namespace

vantrel::elastic::Document ToDocument(const Json::Value& json) {
  if (!json.isObject()) RefuseDocument("a document is an object of fields");
  vantrel::elastic::Document document;
  const auto add = [&](const std::string& field, const Json::Value& value) {
    if (!value.isString()) RefuseValue(field);
    document.fields.push_back({field, value.asString()});
  };
  for (auto member = json.begin(); member != json.end(); ++member) {
    const std::string field = member.name();
    if (!member->isArray()) {
      add(field, *member);
    } else {
      for (const Json::Value& value : *member) add(field, value);
    }
  }
  return document;
}

}  // namespace quorelasticd
