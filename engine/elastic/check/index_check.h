#pragma once

#include <vector>

#include "elastic/format/commit/commit.h"
#include "elastic/format/io/folder.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic::check {

// CheckIndexHealth for any kind of folder.
HealthReport CheckFolder(const format::Folder& folder, const HealthOptions& options);

// What the check finds in the segments of a commit, and nothing about the commit itself. Throws what CheckIndexHealth
// throws.
std::vector<HealthFinding> CheckSegments(const format::Folder& folder, const format::Commit& commit);

}  // namespace vantrel::elastic::check
