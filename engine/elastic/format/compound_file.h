#pragma once

#include <map>
#include <memory>
#include <string>

#include "elastic/format/byte_source.h"

namespace vantrel::elastic::format {

// A file that holds others (.cfs). Layout:
//
//   VInt count, then for each sub-file: Long offset of its first byte in this file, String name
//   the sub-files in the order of the table, without gaps, the last up to the end
class CompoundFile {
 public:
  // Reads the table. Throws IndexDamagedError, IndexIoError.
  explicit CompoundFile(std::shared_ptr<const ByteSource> source);

  bool Exists(const std::string& name) const { return parts_.contains(name); }

  // A view of a sub-file that shares the ownership of this file. Throws IndexError when there is none.
  std::shared_ptr<const ByteSource> Open(const std::string& name) const;

 private:
  struct Part {
    uint64_t offset;
    uint64_t size;
  };

  std::shared_ptr<const ByteSource> source_;
  std::map<std::string, Part> parts_;
};

}  // namespace vantrel::elastic::format
