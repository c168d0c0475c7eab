#pragma once

namespace vantrel::elastic {

// The file in an index's folder that a writer holds its lock on (an exclusive open-file-description lock over the
// whole file). It is never deleted as long as the index is there.
inline constexpr const char* kIndexLockFileName = "quorelastic.lock";

}  // namespace vantrel::elastic
