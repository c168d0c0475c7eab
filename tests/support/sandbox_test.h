#pragma once

#include <gtest/gtest.h>

#include "support/sandbox.h"

namespace quorelastic::testing {

// The base of tests that run programs in a sandbox; they are skipped, with the reason, where none can be had.
class SandboxTest : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!Sandbox::Refusal().empty()) GTEST_SKIP() << "no sandbox on this machine: " << Sandbox::Refusal();
  }
};

}  // namespace quorelastic::testing
