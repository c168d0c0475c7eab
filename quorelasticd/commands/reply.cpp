#include "commands/reply.h"

#include <utility>

#include "quordaemon/wire.h"
#include "vantrel/elastic/json_value.h"

namespace quorelasticd {

ReplyWriter::ReplyWriter() : start_(std::chrono::steady_clock::now()) {}

void ReplyWriter::Describe(const Command* command, Json::Value request_id) {
  command_ = command;
  request_id_ = std::move(request_id);
}

std::string ReplyWriter::Progress(Json::Value progress) const {
  return Finish(Start("progress", std::move(progress)));
}

std::string ReplyWriter::Result(Json::Value result) const {
  return Finish(StartFinal(true, "result", std::move(result)));
}

std::string ReplyWriter::Partial(Json::Value result, const RequestError& error) const {
  Json::Value reply = StartFinal(false, "result", std::move(result));
  reply["partial"] = true;
  reply["error"] = error.ToJson();
  return Finish(std::move(reply));
}

std::string ReplyWriter::Error(const RequestError& error) const {
  return Finish(StartFinal(false, "error", error.ToJson()));
}

Json::Value ReplyWriter::Start(const char* member, Json::Value value) const {
  Json::Value reply(Json::objectValue);
  if (command_ != nullptr) reply["command"] = command_->name;
  if (!request_id_.isNull()) reply["request_id"] = request_id_;
  reply[member].swap(value);
  return reply;
}

Json::Value ReplyWriter::StartFinal(bool success, const char* member, Json::Value value) const {
  Json::Value reply = Start(member, std::move(value));
  const auto taken = std::chrono::steady_clock::now() - start_;
  reply["took_ms"] =
      static_cast<Json::Int64>(std::chrono::duration_cast<std::chrono::milliseconds>(taken).count());
  reply["success"] = success;
  return reply;
}

std::string ReplyWriter::Finish(Json::Value reply) const {
  vantrel::elastic::JsonValue value;
  value.swap(reply);
  std::string text = value.toString();
  if (text.size() <= quordaemon::kLongestMessage) return text;
  return Error(LimitExceeded("reply_bytes", quordaemon::kLongestMessage, "bytes"));
}

}  // namespace quorelasticd
