#pragma once

#include <json/value.h>

#include "vantrel/elastic/index.h"

namespace quorelasticd {

// Adds "documents", how many an index holds, and "deleted", those that still take space.
inline void AddCounts(const vantrel::elastic::DocumentCounts& counts, Json::Value& object) {
  object["documents"] = static_cast<Json::UInt64>(counts.live);
  object["deleted"] = static_cast<Json::UInt64>(counts.deleted);
}

}  // namespace quorelasticd
