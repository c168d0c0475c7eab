#include "scarce_memory.h"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <new>

namespace quorelastic::testing {
namespace {

constexpr int kPlenty = std::numeric_limits<int>::max();

std::atomic<int> allocations{0};
std::atomic<int> first_to_fail{kPlenty};
std::atomic<int> most_to_fail{0};
thread_local int spared = 0;

bool Fails() {
  if (spared > 0 || first_to_fail == kPlenty) return false;
  const int number = ++allocations;
  return number >= first_to_fail && number - first_to_fail < most_to_fail;
}

}  // namespace

ScarceMemory::ScarceMemory(int first, int count) {
  allocations = 0;
  most_to_fail = count;
  first_to_fail = first;
}

ScarceMemory::~ScarceMemory() { first_to_fail = kPlenty; }

bool ScarceMemory::HasFailed() { return allocations >= first_to_fail; }

SparedThread::SparedThread() { ++spared; }

SparedThread::~SparedThread() { --spared; }

}  // namespace quorelastic::testing

void* operator new(size_t size) {
  if (quorelastic::testing::Fails()) throw std::bad_alloc();
  if (void* const memory = std::malloc(size)) return memory;
  throw std::bad_alloc();
}

void operator delete(void* memory) noexcept { std::free(memory); }

void operator delete(void* memory, size_t /*size*/) noexcept { std::free(memory); }
