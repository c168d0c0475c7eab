#pragma once

#include <cstdint>
#include <string>

// The parsed command line. Each field bears the long name of its option. The members belong to one run and
// are handed to the actions as arguments; the static ones are read by the actions directly. All are written
// by the option loop alone, before any action runs.
struct OptionSet {
  std::string action;
  std::string string;
  std::string path;
  std::string db;
  std::string token;
  int32_t ndoc = 0;
  std::string Index;
  std::string query;
  std::string Plugin;
  std::string Data;

  static inline std::string field;
  static inline bool info = false;
  static inline int64_t max = 1000;
  static inline int64_t size = 10;
  static inline int64_t offset = 0;
};
