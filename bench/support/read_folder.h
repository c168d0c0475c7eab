#pragma once

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <span>
#include <string>
#include <vector>

namespace quorelastic::bench {

// Reads every file below a folder from begin to end, in the order of their names, into one buffer of `buffer_size` bytes,
// and hands each piece to `take`, as std::span<const uint8_t>. False where a file cannot be read.
template <typename Take>
bool ReadFolder(const std::string& folder, size_t buffer_size, Take take) {
  std::vector<std::string> paths;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
    if (entry.is_regular_file()) paths.push_back(entry.path().string());
  }
  std::sort(paths.begin(), paths.end());
  std::vector<uint8_t> buffer(buffer_size);
  for (const std::string& path : paths) {
    const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) return false;
    ssize_t got = 0;
    while ((got = read(file, buffer.data(), buffer.size())) > 0) {
      take(std::span<const uint8_t>(buffer).first(static_cast<size_t>(got)));
    }
    close(file);
    if (got < 0) return false;
  }
  return true;
}

}  // namespace quorelastic::bench
