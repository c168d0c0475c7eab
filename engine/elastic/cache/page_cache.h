#pragma once

#include <cstdint>
#include <vector>

#include "elastic/cache/warm_up_plan.h"
#include "vantrel/elastic/vm_touch.h"

namespace vantrel::elastic {

// Brings the extents into the page cache, one after the other, up to so many bytes.
PageCacheWarmUp BringIn(const std::vector<Extent>& extents, uint64_t most_bytes);

}  // namespace vantrel::elastic
