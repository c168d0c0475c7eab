#pragma once

namespace quorelastic::testing {

// Lets memory run out in a program that is linked with scarce_memory.cpp. As long as it lives, threads that are not
// spared get none: from their allocation of this number on (counted from 1, over all of them), for so many.
class ScarceMemory {
 public:
  explicit ScarceMemory(int first, int count = 1);
  ScarceMemory(const ScarceMemory&) = delete;
  ScarceMemory& operator=(const ScarceMemory&) = delete;
  ~ScarceMemory();

  // Whether it has come to that.
  static bool HasFailed();
};

// Nothing fails in this thread as long as it lives.
class SparedThread {
 public:
  SparedThread();
  SparedThread(const SparedThread&) = delete;
  SparedThread& operator=(const SparedThread&) = delete;
  ~SparedThread();
};

}  // namespace quorelastic::testing
