#include "vantrel/elastic/class_init.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>

namespace vantrel {
namespace {

// Counts what is done to it, and fails where a test wants.
struct Probe {
  enum class Failure { kNone, kConstructor, kInitialize };

  explicit Probe(const std::string& argument, Failure where = Failure::kNone)
      : text(argument), failure(where) {
    if (failure == Failure::kConstructor) throw std::runtime_error("constructor");
    ++alive;
  }
  Probe(const Probe&) = delete;
  Probe& operator=(const Probe&) = delete;
  ~Probe() { --alive; }

  int initialize() {
    ++initialized;
    if (failure == Failure::kInitialize) throw std::logic_error("initialize");
    return 42;  // nobody looks
  }

  static inline int alive = 0;
  std::string text;
  Failure failure;
  int initialized = 0;
};

TEST(ClassInitTest, MakesAnObjectAndCompletesItOnce) {
  const std::shared_ptr<Probe> probe = newClassInit<Probe>("argument");
  EXPECT_EQ(probe->text, "argument");
  EXPECT_EQ(probe->initialized, 1);
  EXPECT_EQ(probe.use_count(), 1);
}

TEST(ClassInitTest, PassesEitherExceptionOnAndLeavesNothingBehind) {
  EXPECT_THROW(newClassInit<Probe>("", Probe::Failure::kConstructor), std::runtime_error);
  EXPECT_THROW(newClassInit<Probe>("", Probe::Failure::kInitialize), std::logic_error);
  EXPECT_EQ(Probe::alive, 0);
}

}  // namespace
}  // namespace vantrel
