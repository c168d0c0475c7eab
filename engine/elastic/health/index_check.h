#pragma once

#include "elastic/format/folder.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic::health {

// CheckIndexHealth for any kind of folder.
HealthReport CheckFolder(const format::Folder& folder, const HealthOptions& options);

}  // namespace vantrel::elastic::health
