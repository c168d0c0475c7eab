#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "elastic/check/stored_fields_check.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/io/folder.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/segment/whole_segment.h"

namespace vantrel::elastic::check {

// The check of one segment, in parts that do not depend on each other and may run on different threads.
class SegmentCheck {
 public:
  struct Part {
    std::string segment;
    uint64_t size = 0;  // of the files it reads, about
    // Throws Mismatch, IndexDamagedError, FileMissingError for what is wrong with the segment; anything else says
    // nothing about it. May hold pointers into the SegmentCheck.
    std::function<void()> run;
  };

  // Opens the segment's files and reads nothing yet but the tables of compound files; `shared` is as for WholeSegment.
  // Throws where the system fails.
  SegmentCheck(const format::Folder& folder, const format::SegmentInfo& info, format::SharedFiles& shared);
  SegmentCheck(const SegmentCheck&) = delete;
  SegmentCheck& operator=(const SegmentCheck&) = delete;

  // Reads the field names, on which all else depends. Throws like a part. Where it does, only those parts are left
  // that can do without.
  void ReadFields();

  std::vector<Part> Parts();

  const format::WholeSegment& files() const { return files_; }

  // About how much memory the names of its fields and sub-files take, in bytes.
  uint64_t NamesMemory() const;

 private:
  void CheckFields() const;
  void CheckCompounds() const;
  void CheckDeletions() const;
  void CheckNorms() const;
  void CheckCommonNorms(uint64_t fields_with_norms) const;
  void CheckTerms() const;
  void CheckStoredFields() const;
  void CheckVectors() const;
  bool HasPositions() const;
  StoreSlice Slice() const;
  void AddPart(std::vector<Part>& parts, std::initializer_list<const char*> extensions,
               void (SegmentCheck::*check)() const);

  format::WholeSegment files_;
  std::optional<std::vector<format::FieldInfo>> fields_;
};

}  // namespace vantrel::elastic::check
