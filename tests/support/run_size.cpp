#include "support/run_size.h"

#include <cstdlib>
#include <iostream>
#include <random>
#include <stdexcept>

namespace quorelastic::testing {
namespace {

constexpr const char* kSeedName = "QUORELASTIC_SEED";

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
  if (text == nullptr) return by_default;
  const auto size = static_cast<int>(ToNumber(name, text));
  if (size <= 0) throw std::runtime_error(std::string(name) + ": a run of that size tries nothing: " + text);
  return size;
}

uint32_t RunSeed() { return RunSeed(std::random_device()()); }

uint32_t RunSeed(uint32_t by_default) {
  const char* text = std::getenv(kSeedName);
  const uint32_t seed = text == nullptr ? by_default : static_cast<uint32_t>(ToNumber(kSeedName, text));
  Tell("repeat with", std::string(kSeedName) + "=" + std::to_string(seed));
  return seed;
}

void Tell(const std::string& run, const std::string& figure) {
  std::cout << run << ": " << figure << std::endl;
}

}  // namespace quorelastic::testing
