#include "base/turns.h"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <thread>

namespace quorelasticd {
namespace {

TEST(Turns, AreAsManyAsWereSaid) {
  Turns turns(2);
  const Turns::Turn first(turns);
  auto second = std::make_unique<Turns::Turn>(turns);
  EXPECT_TRUE(first.is_taken());
  EXPECT_TRUE(second->is_taken());
  EXPECT_FALSE(Turns::Turn(turns).is_taken());
  second.reset();
  EXPECT_TRUE(Turns::Turn(turns).is_taken());
}

TEST(Turns, ThereAreNoneWhereThereIsNoPlace) {
  Turns turns(0);
  EXPECT_FALSE(Turns::Turn(turns).is_taken());
}

// Whoever is refused must have come while another had the turn, not while another was being refused.
TEST(Turns, OneThatHasComeFreeIsNotLostToATryThatFails) {
  Turns turns(1);
  std::atomic<bool> is_over{false};
  std::atomic<int> gained{0};  // by the other, and counted before it gives the turn back
  std::thread other([&] {
    while (!is_over) {
      const Turns::Turn turn(turns);
      if (turn.is_taken()) ++gained;
    }
  });
  int lost = 0;
  for (int i = 0; i < 500000; ++i) {
    int before = 0;
    {
      const Turns::Turn held(turns);
      if (!held.is_taken()) continue;
      before = gained;
    }
    if (Turns::Turn(turns).is_taken()) continue;
    while (!Turns::Turn(turns).is_taken()) {
    }
    if (gained == before) ++lost;
  }
  is_over = true;
  other.join();
  EXPECT_EQ(lost, 0);
}

}  // namespace
}  // namespace quorelasticd
