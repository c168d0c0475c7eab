#pragma once

#include <cstdint>
#include <string>

namespace vantrel::elastic {

// How many bytes of files this process can bring into the page cache, by the kernel's own estimate, before the
// kernel has to throw out what is in use: the memory that is available on the machine or, where less, within the
// limits of the control groups that the process is in. What the page cache holds already counts as available, but
// not shared memory, which has no other place. The largest number where the kernel does not tell. `system_root` is where
// /proc and /sys are looked for.
uint64_t AvailableMemory(const std::string& system_root = "");

}  // namespace vantrel::elastic
