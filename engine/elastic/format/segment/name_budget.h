#pragma once

#include <cstdint>
#include <string>

#include "elastic/format/io/byte_reader.h"

namespace vantrel::elastic::format {

// Bounds for the names in one file, in bytes of UTF-8: the field names of a .fnm file, and the names of sub-files in a
// compound file. The size of the file is no bound: a sparse file may announce gigabytes of names and take a few blocks
// on disk. The index library keeps each name several times, four bytes a character: what it may take for those of all
// segments is for opening_check.h to say.

// The longest name: no more than a block of a file system, so that every name takes room on disk.
inline constexpr uint64_t kLongestName = uint64_t{4} << 10;
// All names of the file together: 32 bytes for each of the most fields that there may be (field_infos.h).
inline constexpr uint64_t kMostNameBytes = uint64_t{2} << 20;

// Counts the names of one file while they are read.
class NameBudget {
 public:
  // Counts a name that begins at `offset`. Throws IndexDamagedError where it is longer than kLongestName, or the names
  // up to it take more than kMostNameBytes.
  void Take(const ByteReader& reader, uint64_t offset, const std::string& name) {
    if (name.size() > kLongestName) {
      reader.Damaged(offset, "name of " + std::to_string(name.size()) + " bytes is too long");
    }
    if (name.size() > left_) {
      reader.Damaged(offset, "the names up to this one take more than " + std::to_string(kMostNameBytes) +
                                 " bytes together");
    }
    left_ -= name.size();
  }

 private:
  uint64_t left_ = kMostNameBytes;
};

}  // namespace vantrel::elastic::format
