#pragma once

#include <exception>
#include <functional>
#include <string>

#include "elastic/index/disk_directory.h"

namespace vantrel::elastic {

// Runs an operation that reads through the index library, and turns what the library or the system throws into
// IndexError about `folder`, with the purpose ("cannot search") and the reason. Our own exceptions, and the
// one for a lack of memory, pass on.
void RunReading(const std::string& folder, const boost::shared_ptr<DiskDirectory>& directory,
                const char* purpose, const std::function<void()>& operation);

}  // namespace vantrel::elastic
