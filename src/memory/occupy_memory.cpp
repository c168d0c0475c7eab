#include "memory/occupy_memory.h"

#include <unistd.h>

#include <cstddef>
#include <cstdlib>
#include <iostream>

namespace {

// Makes the compiler believe that somebody reads the block. It sees that nobody does, and would leave out filling
// it, and then allocating it.
void KeepFilled(const void* block) { asm volatile("" : : "r"(block) : "memory"); }

}  // namespace

void OccupyMemory(uint32_t megabytes) {
  const uint32_t size = megabytes << 20;  // wraps from 4096 on, and is meant to
  auto* const block = static_cast<char*>(std::malloc(size));
  if (block == nullptr) {
    std::cerr << "malloc failed" << std::endl;
    return;
  }
  for (size_t i = 0; i < size; ++i) block[i] = '0';
  KeepFilled(block);
  std::cerr << "Occupied " << megabytes << " MB, waiting ";
  for (;;) {
    std::cerr << ".";
    sleep(1);
  }
}
