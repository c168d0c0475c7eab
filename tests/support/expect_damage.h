#pragma once

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "vantrel/elastic/index_error.h"

namespace quorelastic::testing {

// `action` must report damage at `offset`, in words that contain `problem`.
template <typename Action>
void ExpectDamage(uint64_t offset, const std::string& problem, Action action) {
  try {
    action();
    ADD_FAILURE() << "no damage seen, expected: " << problem;
  } catch (const vantrel::elastic::IndexDamagedError& error) {
    EXPECT_EQ(error.offset(), offset) << error.what();
    EXPECT_THAT(error.what(), ::testing::StartsWith(error.path() + ": offset " + std::to_string(offset)));
    EXPECT_THAT(error.what(), ::testing::HasSubstr(problem));
  }
}

// `action` must end in an IndexError (or one derived from it) whose words contain `problem`.
template <typename Action>
void ExpectIndexError(const std::string& problem, Action action) {
  try {
    action();
    ADD_FAILURE() << "no error seen, expected: " << problem;
  } catch (const vantrel::elastic::IndexError& error) {
    EXPECT_THAT(error.what(), ::testing::HasSubstr(problem));
  }
}

}  // namespace quorelastic::testing
