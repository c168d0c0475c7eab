#pragma once

#include <string>

namespace quorelasticd {

// Sends the log to standard error, from `level` ("debug", "info", "warning" or "error") up. Where the system's
// journal reads it, lines carry the journal's priority instead of a time of their own.
void StartLogging(const std::string& level);

}  // namespace quorelasticd
