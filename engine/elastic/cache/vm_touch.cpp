#include "vantrel/elastic/vm_touch.h"

#include "elastic/cache/available_memory.h"
#include "elastic/cache/page_cache.h"
#include "elastic/cache/warm_up_plan.h"
#include "vantrel/elastic/index_container.h"

namespace vantrel::elastic {

PageCacheWarmUp WarmPageCache(const std::string& root) {
  // The kernel's estimate is one, and others want memory meanwhile: an eighth is left to them.
  const uint64_t available = AvailableMemory();
  return BringIn(PlanWarmUp(root), available - available / 8);
}

void VMTouch() { WarmPageCache(IndexRoot()); }

}  // namespace vantrel::elastic
