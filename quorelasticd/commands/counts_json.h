#pragma once

#include <json/value.h>

#include "vantrel/elastic/index.h"

namespace quorelasticd {

// Adds how many documents an index holds as of its last commit: "documents", and "deleted", those that still take
// space.
inline void AddCounts(const vantrel::elastic::Index& index, Json::Value& object) {
  const vantrel::elastic::DocumentCounts counts = index.CountDocuments();
  object["documents"] = static_cast<Json::UInt64>(counts.live);
  object["deleted"] = static_cast<Json::UInt64>(counts.deleted);
}

}  // namespace quorelasticd
