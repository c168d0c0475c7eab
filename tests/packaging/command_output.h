#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/tool_run.h"

namespace quorelastic::testing {

// What a command that is to succeed writes to standard output.
inline std::string OutputOf(const std::vector<std::string>& command, const RunOptions& options = {}) {
  const RunResult run = RunCommand(command, options);
  EXPECT_EQ(run.status, 0) << run;
  return run.out;
}

}  // namespace quorelastic::testing
