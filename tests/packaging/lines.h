#pragma once

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "support/tool_run.h"

namespace quorelastic::testing {

inline std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  return lines;
}

// What a command that is to succeed writes to standard output.
inline std::string OutputOf(const std::vector<std::string>& command, const RunOptions& options = {}) {
  const RunResult run = RunCommand(command, options);
  EXPECT_EQ(run.status, 0) << run;
  return run.out;
}

}  // namespace quorelastic::testing
