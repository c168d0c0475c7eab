#pragma once

#include <exception>
#include <memory>
#include <string>
#include <vector>

#include "elastic/format/commit/commit.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"

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
  std::exception_ptr liveness_failure;  // why one of the last two is missing though it should not be
};

// Whether the files of the segment are in a compound file (.cfs), and whether it has a file of deletions (.del): where
// the commit does not say, as in the older layouts, the folder decides. Throw IndexIoError.
bool IsCompound(const Folder& folder, const SegmentInfo& info);
bool HasDeletions(const Folder& folder, const SegmentInfo& info);

// What must be there: everything, or just what a walk over all terms needs. In the second case what is missing
// of the rest is told by liveness_failure.
enum class Need { kAll, kTerms };

// Throws IndexError where a file is missing or cannot be opened.
SegmentFiles OpenSegment(const Folder& folder, SegmentInfo info, Need need = Need::kAll);

// The same for every segment of the folder's newest commit, also where a writer replaces it meanwhile. Their .fnm files
// take at most 4 MiB together, as the names of all of them may be kept in memory: more is damage. Throws IndexError.
std::vector<SegmentFiles> OpenNewestSegments(const Folder& folder, Need need);

}  // namespace vantrel::elastic::format
