#pragma once

#include <cstdint>
#include <string>

#include "elastic/format/byte_reader.h"

namespace vantrel::elastic::format {

// How many bytes of UTF-8 the names of one file may take together: the field names of a .fnm file, and the names of
// sub-files in a compound file. That is 100,000 field names of 20 bytes. The size of the file is no bound: a sparse file
// may announce gigabytes of names and take a few blocks on disk. The index library keeps each name several times, four
// bytes a character.
inline constexpr uint64_t kMostNameBytes = uint64_t{2} << 20;

// Counts the names of one file while they are read.
class NameBudget {
 public:
  // Counts a name that begins at `offset`. Throws IndexDamagedError where the names up to this one take more than
  // kMostNameBytes.
  void Take(const ByteReader& reader, uint64_t offset, const std::string& name) {
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
