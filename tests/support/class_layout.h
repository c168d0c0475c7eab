#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>

namespace quorelastic::testing {

// Where a class keeps its members and its virtual operations, for classes whose layout other programs know. By the
// C++ ABI of this platform: an object begins with the address of its table of virtual operations, of which the
// destructor takes two slots; a pointer to a virtual member tells its slot.

// The member of type T that begins `offset` bytes into `object`.
template <typename T, typename Class>
const T& MemberAt(const Class& object, size_t offset) {
  return *std::launder(reinterpret_cast<const T*>(reinterpret_cast<const char*>(&object) + offset));
}

// The slot of a virtual operation; of any other member, a large number.
template <typename Operation>
size_t SlotOf(Operation operation) {
  static_assert(sizeof operation == 2 * sizeof(void*));
  uintptr_t first = 0;
  std::memcpy(&first, &operation, sizeof first);
  return first / sizeof(void*);
}

// Calls a destructor through its slot: the first one leaves the memory, the second one frees it.
inline void DestroyThroughSlot(void* object, size_t slot) {
  const char* table = nullptr;
  std::memcpy(&table, object, sizeof table);
  void (*destroy)(void*) = nullptr;
  std::memcpy(&destroy, table + slot * sizeof(void*), sizeof destroy);
  destroy(object);
}

// Whether the table of a class holds nothing but its destructor: what a derived class adds comes next.
template <typename Class>
bool HasOnlyItsDestructor() {
  struct Derived : Class {
    using Class::Class;
    virtual void Added() {}
  };
  return SlotOf(&Derived::Added) == 2;
}

}  // namespace quorelastic::testing
