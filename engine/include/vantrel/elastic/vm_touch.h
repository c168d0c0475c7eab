#pragma once

#include <cstdint>
#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// What a warm-up did.
struct PageCacheWarmUp {
  uint64_t bytes = 0;     // now in the page cache, also of what was there before
  bool is_whole = false;  // nothing was left out for want of memory
};

// Brings the files of every index under a folder into the page cache, each index being a folder of its own in it.
// What searches need first is read first, over all indexes: the indexes over the dictionaries, the dictionaries,
// norms, documents of the terms, positions, then the rest; parts of compound files count by what they are. It stops
// before it would push out what it has just brought in. What cannot be read is passed over, and nothing is thrown
// over it: no folder, no index, a file that may not be read or shrinks.
//
// Returns once the pages are there. Takes as long as the disk does; may run beside searches and writers.
VANTREL_ELASTIC_EXPORT PageCacheWarmUp WarmPageCache(const std::string& root);

// The same for IndexRoot().
VANTREL_ELASTIC_EXPORT void VMTouch();

}  // namespace vantrel::elastic
