#include "commands/request.h"

#include "base/limits.h"
#include "base/text.h"
#include "commands/command_table.h"
#include "commands/json_text.h"

namespace quorelasticd {
namespace {

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
                      IsValidUtf8(id.asString());
  return is_fit ? id : Json::Value();
}

void TakeEnvelope(const Json::Value& root, Request& request) {
  request.request_id = FindRequestId(root);
  const Json::Value name = root.get("command", Json::Value());
  if (name.isString()) request.command = FindCommand(name.asString());
}

// What a request that was not built is about, if that can be told without its data.
void TakeEnvelopeOfUnbuilt(const std::string& text, Request& request) {
  try {
    const Json::Value root = ParseJson(WithoutMember(text, "data"), "");
    if (root.isObject()) TakeEnvelope(root, request);
  } catch (...) {
    // Then the reply goes without.
  }
}

// What can be told of the request is told before the first thing that is wrong with it is thrown.
void TakeApart(const std::string& text, Request& request) {
  Json::Value root;
  try {
    root = ParseJson(text, "the request");
  } catch (...) {
    TakeEnvelopeOfUnbuilt(text, request);
    throw;
  }
  if (!root.isObject()) CheckShape(RequestShape(), root, "");
  TakeEnvelope(root, request);
  CheckShape(RequestShape(), root, "");
  if (request.command == nullptr) {
    throw RequestError(ErrorCode::kUnknownCommand, "there is no command " +
                                                       Quoted(root["command"].asString()) +
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
