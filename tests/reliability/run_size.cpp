#include "run_size.h"

#include <cstdlib>
#include <iostream>
#include <random>
#include <stdexcept>

namespace quorelastic::testing {
namespace {

unsigned long ToNumber(const char* name, const std::string& text) {
  size_t used = 0;
  unsigned long number = 0;
  try {
    number = std::stoul(text, &used);
  } catch (const std::exception&) {
    used = 0;
  }
  if (used != text.size() || used == 0) {
    throw std::runtime_error(std::string(name) + ": expected a number, found " + text);
  }
  return number;
}

}  // namespace

int RunSize(const char* name, int by_default) {
  const char* text = std::getenv(name);
  return text == nullptr ? by_default : static_cast<int>(ToNumber(name, text));
}

uint32_t RunSeed() {
  const char* name = "QUORELASTIC_SEED";
  const char* text = std::getenv(name);
  const uint32_t seed =
      text == nullptr ? std::random_device()() : static_cast<uint32_t>(ToNumber(name, text));
  Tell("repeat with", std::string(name) + "=" + std::to_string(seed));
  return seed;
}

void Tell(const std::string& run, const std::string& figure) {
  std::cout << run << ": " << figure << std::endl;
}

}  // namespace quorelastic::testing
