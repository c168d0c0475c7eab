#pragma once

#include <memory>
#include <string>

#include "elastic/format/byte_source.h"
#include "elastic/format/commit.h"
#include "elastic/format/folder.h"

namespace vantrel::elastic::format {

// The open files of one segment that its term dictionary needs, plain or out of a compound file. Opening
// reads nothing but a compound file's table; what is open stays readable when a writer deletes the file.
struct SegmentFiles {
  SegmentInfo info;
  std::shared_ptr<const ByteSource> field_infos;  // .fnm
  std::shared_ptr<const ByteSource> terms;        // .tis
  std::shared_ptr<const ByteSource> terms_index;  // .tii
  std::shared_ptr<const ByteSource> postings;     // .frq, only where documents are deleted
  std::shared_ptr<const ByteSource> deletions;    // .del, only where documents are deleted
};

// Throws IndexError where a file is missing or cannot be opened.
SegmentFiles OpenSegment(const Folder& folder, SegmentInfo info);

}  // namespace vantrel::elastic::format
