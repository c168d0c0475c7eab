#pragma once

#include <cstdint>

// Takes so many MiB of memory, modulo 4096, and holds them until the process is killed: each page is really there,
// and each second shows a dot. Returns only where that much memory is not to be had.
void OccupyMemory(uint32_t megabytes);
