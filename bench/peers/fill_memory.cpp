// Fills a fresh block of so many MiB by one memset, says so, and waits to be killed.

#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <iostream>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: peer_fill_memory MEGABYTES\n";
    return 2;
  }
  const size_t size = std::strtoull(argv[1], nullptr, 10) << 20;
  void* const block = std::malloc(size);
  if (block == nullptr) return 1;
  std::memset(block, 0x30, size);
  asm volatile("" : : "r"(block) : "memory");  // or the compiler leaves out what nobody reads
  std::cerr << "waiting ";
  for (;;) pause();
}
