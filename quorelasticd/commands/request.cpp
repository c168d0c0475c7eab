#include "commands/request.h"

#include <json/reader.h>

#include <algorithm>
#include <memory>

#include "base/limits.h"
#include "base/text.h"
#include "commands/command_table.h"

namespace quorelasticd {
namespace {

// How deep the brackets of a text nest, strings left aside.
int64_t JsonDepth(const std::string& text) {
  int64_t depth = 0;
  int64_t deepest = 0;
  bool in_string = false;
  for (size_t i = 0; i < text.size(); ++i) {
    const char c = text[i];
    if (in_string) {
      if (c == '\\') ++i;
      in_string = c != '"';
      continue;
    }
    in_string = c == '"';
    if (c == '[' || c == '{') deepest = std::max(deepest, ++depth);
    if (c == ']' || c == '}') --depth;
  }
  return deepest;
}

// Where and why the parser gives up; it is asked again, as the common case needs no such text.
std::string ParserComplaint(const std::string& text) {
  Json::CharReaderBuilder builder;
  builder["collectComments"] = false;
  builder["allowTrailingCommas"] = false;
  builder["failIfExtra"] = true;
  std::string complaint;
  try {
    Json::Value ignored;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    reader->parse(text.data(), text.data() + text.size(), &ignored, &complaint);
  } catch (const Json::Exception& error) {
    complaint = error.what();
  }
  constexpr size_t kLongestComplaint = 200;
  std::string line = ToOneLine(complaint.substr(0, kLongestComplaint));
  line.erase(0, line.find_first_not_of("* "));
  line.erase(line.find_last_not_of(' ') + 1);
  return line;
}

Json::Value ParseRoot(const std::string& text) {
  if (const size_t at = FindInvalidUtf8(text); at != std::string::npos) {
    throw RequestError(ErrorCode::kBadRequest,
                       "the request is no valid UTF-8: byte " + std::to_string(at) + " (counted from 0)");
  }
  vantrel::elastic::JsonValue root;
  if (!root.fromString(text)) {
    if (JsonDepth(text) > kMostJsonDepth) throw LimitExceeded("json_depth", kMostJsonDepth, "levels");
    throw RequestError(ErrorCode::kBadRequest, "the request is no JSON document: " + ParserComplaint(text));
  }
  return root;
}

const Shape& RequestShape() {
  static const Shape shape = Object({
      {"command", true, Text(), "The command's name."},
      {"data", false, Any(), "What the command works on."},
      {"request_id", false, Either({String(kLongestRequestId), Number()}), "Echoed in every reply."},
  });
  return shape;
}

// Null where there is none that every reply can carry.
Json::Value FindRequestId(const Json::Value& request) {
  const Json::Value id = request.get("request_id", Json::Value());
  if (id.isNumeric()) return id;
  const bool is_fit = id.isString() && static_cast<int64_t>(id.asString().size()) <= kLongestRequestId &&
                      FindInvalidUtf8(id.asString()) == std::string::npos;
  return is_fit ? id : Json::Value();
}

// What can be told of the request is told before the first thing that is wrong with it is thrown.
void TakeApart(const std::string& text, Request& request) {
  Json::Value root = ParseRoot(text);
  if (!root.isObject()) CheckShape(RequestShape(), root, "");
  request.request_id = FindRequestId(root);
  const Json::Value name = root.get("command", Json::Value());
  if (name.isString()) request.command = FindCommand(name.asString());
  CheckShape(RequestShape(), root, "");
  if (request.command == nullptr) {
    throw RequestError(ErrorCode::kUnknownCommand, "there is no command " + Quoted(name.asString()) +
                                                       "; the command \"help\" lists those there are");
  }
  if (root.isMember("data")) request.data.swap(root["data"]);
  CheckShape(request.command->data, request.data, "data");
}

}  // namespace

Request ParseRequest(const std::string& text) {
  Request request;
  try {
    TakeApart(text, request);
  } catch (...) {
    request.error = ToRequestError();
  }
  return request;
}

}  // namespace quorelasticd
