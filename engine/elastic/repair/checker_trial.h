#pragma once

#include <cstdint>
#include <string>

namespace vantrel::elastic {

// Whether the index library's checker lives through one segment of the index in a folder: it is
// run in a child process with 2 GiB of memory and a time that goes with `index_bytes`. What it finds is no matter.
// To be called where the process has no other thread. Throws std::system_error where there can be no child.
bool CheckerSurvives(const std::string& path, const std::string& segment, uint64_t index_bytes);

}  // namespace vantrel::elastic
