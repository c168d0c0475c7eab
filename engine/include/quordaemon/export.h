#pragma once

// Marks what libquordaemon offers to its users; everything else is hidden in the library.
#define QUORDAEMON_EXPORT __attribute__((visibility("default")))
