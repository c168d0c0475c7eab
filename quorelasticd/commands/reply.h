#pragma once

#include <chrono>
#include <string>

#include "commands/request.h"

namespace quorelasticd {

// Writes the replies to one request. Each is one message's payload.
class ReplyWriter {
 public:
  // The clock of "took_ms" starts.
  ReplyWriter();

  // What the replies from now on carry. `command` is null where the request named none that is known, `request_id`
  // where it gave none.
  void Describe(const Command* command, Json::Value request_id);

  std::string Progress(Json::Value progress) const;
  std::string Result(Json::Value result) const;

  // No success, though a part was done.
  std::string Partial(Json::Value result, const RequestError& error) const;

  std::string Error(const RequestError& error) const;

 private:
  Json::Value Start(const char* member, Json::Value value) const;
  Json::Value StartFinal(bool success, const char* member, Json::Value value) const;
  std::string Finish(Json::Value reply) const;

  const Command* command_ = nullptr;
  Json::Value request_id_;
  std::chrono::steady_clock::time_point start_;
};

}  // namespace quorelasticd
