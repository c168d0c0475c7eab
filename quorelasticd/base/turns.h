#pragma once

#include <atomic>

namespace quorelasticd {

// So many may do something at a time; who comes when all turns are taken has to do without. For any thread.
class Turns {
 public:
  explicit Turns(int count) : left_(count) {}
  Turns(const Turns&) = delete;
  Turns& operator=(const Turns&) = delete;

  // A turn, or none, given back when it goes.
  class Turn {
   public:
    explicit Turn(Turns& turns) : turns_(turns), is_taken_(turns.TryTake()) {}
    Turn(const Turn&) = delete;
    Turn& operator=(const Turn&) = delete;
    ~Turn() {
      if (is_taken_) ++turns_.left_;
    }

    bool is_taken() const { return is_taken_; }

   private:
    Turns& turns_;
    const bool is_taken_;
  };

 private:
  bool TryTake() {
    // Never below zero, not even for a moment: another's try would fail though a turn has come free.
    int left = left_;
    while (left > 0) {
      if (left_.compare_exchange_weak(left, left - 1)) return true;
    }
    return false;
  }

  std::atomic<int> left_;
};

}  // namespace quorelasticd
