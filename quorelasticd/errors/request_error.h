#pragma once

#include <json/value.h>

#include <cstdint>
#include <exception>
#include <string>

#include "errors/error_code.h"

namespace quorelasticd {

// Ends a request with an error reply.
class RequestError : public std::exception {
 public:
  // `reason` becomes one line of valid UTF-8, whatever its bytes are. `details`, an object, holds further members
  // of the reply's "error".
  RequestError(ErrorCode code, const std::string& reason, Json::Value details = Json::objectValue);

  ErrorCode code() const { return code_; }
  const std::string& reason() const { return reason_; }
  const Json::Value& details() const { return details_; }
  const char* what() const noexcept override { return reason_.c_str(); }

  // The value of a reply's "error".
  Json::Value ToJson() const;

 private:
  ErrorCode code_;
  std::string reason_;
  Json::Value details_;
};

// A limit_exceeded: `limit` is the limit's name, `most` what it allows, `unit` of what.
RequestError LimitExceeded(const std::string& limit, int64_t most, const std::string& unit);

// What the exception being handled, any, means to a client. Called within a catch block.
RequestError ToRequestError();

// The same for a request that commits, with whether it had done so in the member "committed".
RequestError ToRequestError(bool is_committed);

}  // namespace quorelasticd
