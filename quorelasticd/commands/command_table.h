#pragma once

#include <string_view>
#include <vector>

#include "commands/command.h"

namespace quorelasticd {

// The version of the protocol, see docs/protocol.md for what may change within it.
inline constexpr const char* kProtocolVersion = "1";

// Every command, in the order that "help" lists them. One table checks requests, starts commands and describes
// them.
const std::vector<Command>& CommandTable();

// Null where there is no such command.
const Command* FindCommand(std::string_view name);

}  // namespace quorelasticd
