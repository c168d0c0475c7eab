#pragma once

#include "elastic/format/io/folder.h"
#include "vantrel/elastic/index.h"

namespace vantrel::elastic {

// Reads the newest commit within bounds; nothing of the index library is involved. Throws IndexError.
IndexStatistics ReadStatistics(const format::DiskFolder& folder);

}  // namespace vantrel::elastic
