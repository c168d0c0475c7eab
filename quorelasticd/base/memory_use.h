#pragma once

#include <algorithm>
#include <cstddef>

namespace quorelasticd {

// Gives the memory that a large text took back to the system, which the allocator would keep for the next one. What
// is made of a text is freed in many small pieces: to find them takes a while, but less than to make them took.
// That happens every 20 milliseconds at most; what goes meanwhile waits for the next call, of whichever object.
// A member of this kind stands before the members that hold the text, so that it goes after them.
class MemoryUse {
 public:
  MemoryUse() = default;
  MemoryUse(const MemoryUse&) = delete;
  MemoryUse& operator=(const MemoryUse&) = delete;
  ~MemoryUse() { GiveBack(); }

  // A text of so many bytes is held, or was.
  void Note(size_t bytes) { largest_ = std::max(largest_, bytes); }

  // To be called when the texts are gone.
  void GiveBack();

 private:
  size_t largest_ = 0;
};

}  // namespace quorelasticd
