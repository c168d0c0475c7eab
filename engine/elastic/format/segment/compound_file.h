#pragma once

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"

namespace vantrel::elastic::format {

// A file that holds others (.cfs). Layout:
//
//   VInt count, then for each sub-file: Long offset of its first byte in this file, String name
//   the sub-files in the order of the table, without gaps, the last up to the end
//
// At most kMostSubFiles of them, with names within the bounds of name_budget.h: more is damage. So what is taken is
// bounded, whatever the file.
class CompoundFile {
 public:
  // Where a sub-file stands.
  struct Part {
    uint64_t offset;
    uint64_t size;
  };

  // A segment has a dozen files, and in the older layouts one more for each field.
  static constexpr uint32_t kMostSubFiles = uint32_t{1} << 14;

  // Reads the table. Throws IndexDamagedError, IndexIoError.
  explicit CompoundFile(std::shared_ptr<const ByteSource> source);

  // By name.
  const std::map<std::string, Part>& parts() const { return parts_; }

  bool Exists(const std::string& name) const { return parts_.contains(name); }

  // The names of the sub-files, sorted.
  std::vector<std::string> Names() const;

  const ByteSource& source() const { return *source_; }
  uint64_t table_end() const { return table_end_; }
  // Where the first sub-file begins; the end of the file where there is none.
  uint64_t first_offset() const { return first_offset_; }

  // A view of a sub-file that shares the ownership of this file. Throws IndexError when there is none.
  std::shared_ptr<const ByteSource> Open(const std::string& name) const;

 private:
  std::shared_ptr<const ByteSource> source_;
  std::map<std::string, Part> parts_;
  uint64_t table_end_ = 0;
  uint64_t first_offset_ = 0;
};

}  // namespace vantrel::elastic::format
