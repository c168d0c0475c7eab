#pragma once

#include <functional>

#include "elastic/index/disk_directory.h"

namespace vantrel::elastic {

// Runs an operation that reads through the index library, and turns what the library or the system throws into
// IndexError about the directory's folder, with the purpose ("cannot search") and the reason; IndexIoError where the
// system is to blame. Our own exceptions, and the one for a lack of memory, pass on.
void RunReading(const boost::shared_ptr<DiskDirectory>& directory, const char* purpose,
                const std::function<void()>& operation);

}  // namespace vantrel::elastic
