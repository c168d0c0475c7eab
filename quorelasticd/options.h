#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>

#include "version.h"

namespace quorelasticd {

// What the command line settles. Paths are bytes.
struct Options {
  std::string socket = "/var/run/quorelasticd.sock";
  std::string data = kDefaultData;
  std::string log_level = "info";
  std::string plugins;  // a folder; empty for none
  int64_t threads = 4;
  int64_t max_connections = 256;
  int64_t max_open_indexes = 100;
  int64_t idle_timeout = 300;  // seconds, as the two below
  int64_t stall_timeout = 30;
  int64_t shutdown_timeout = 60;
  double search_timeout = 30;
};

// A command line that makes no sense; what() is one line.
class OptionError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// The options; nothing where only a text was asked for, by --help or --version, which is in `text` then. Throws
// OptionError.
std::optional<Options> ParseOptions(int argc, const char* const* argv, std::string& text);

}  // namespace quorelasticd
