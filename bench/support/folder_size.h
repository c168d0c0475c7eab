#pragma once

#include <cstdint>
#include <filesystem>
#include <string>

namespace quorelastic::bench {

// What the files in a folder take, in bytes.
inline uint64_t FolderSize(const std::string& folder) {
  uint64_t size = 0;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) size += entry.file_size();
  return size;
}

}  // namespace quorelastic::bench
