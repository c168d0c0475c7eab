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
    if (--left_ >= 0) return true;
    ++left_;
    return false;
  }

  std::atomic<int> left_;
};

}  // namespace quorelasticd
