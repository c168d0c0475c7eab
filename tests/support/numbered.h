#pragma once

#include <string>

namespace quorelastic::testing {

// "t7": the compiler takes the sum of such strings for an overlap.
inline std::string Numbered(const char* start, int number) {
  std::string text = start;
  text += std::to_string(number);
  return text;
}

}  // namespace quorelastic::testing
