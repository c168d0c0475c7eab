#pragma once

#include <json/value.h>

#include <optional>
#include <string>

#include "commands/command.h"
#include "errors/request_error.h"

namespace quorelasticd {

// A request as far as it was understood.
struct Request {
  const Command* command = nullptr;  // null when it names none, or an unknown one
  Json::Value request_id;            // null when it gives none that can be echoed
  Json::Value data = Json::objectValue;
  std::optional<RequestError> error;  // what is wrong with it; `data` is then not to be used
};

// Takes a request apart and checks it against the table of commands.
Request ParseRequest(const std::string& text);

}  // namespace quorelasticd
