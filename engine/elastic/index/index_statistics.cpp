#include "elastic/index/index_statistics.h"

#include <sys/stat.h>

#include <utility>

#include "elastic/common/path.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/segment/deletions.h"
#include "elastic/segment/segment_files.h"

namespace vantrel::elastic {
namespace {

uint64_t CountBytes(const format::DiskFolder& folder) {
  uint64_t bytes = 0;
  for (const std::string& name : folder.List()) {
    struct stat status {};
    // What is gone since it was listed takes no more space.
    if (lstat(JoinPath(folder.path(), name).c_str(), &status) != 0) continue;
    if (S_ISREG(status.st_mode)) bytes += static_cast<uint64_t>(status.st_size);
  }
  return bytes;
}

}  // namespace

IndexStatistics ReadStatistics(const format::DiskFolder& folder) {
  IndexStatistics statistics;
  format::UseNewestCommit(folder, [&](format::Commit commit) {
    statistics = {};
    statistics.generation = commit.generation;
    statistics.segments = commit.segments.size();
    for (format::SegmentInfo& segment : commit.segments) {
      const auto documents = static_cast<uint64_t>(segment.document_count);
      const format::SegmentFiles files = format::OpenSegment(folder, std::move(segment));
      uint64_t deleted = 0;
      if (files.deletions != nullptr) {
        const format::Deletions deletions(files.deletions, files.info.document_count);
        deleted = static_cast<uint64_t>(deletions.count());
      }
      statistics.documents.live += documents - deleted;
      statistics.documents.deleted += deleted;
    }
  });
  statistics.bytes = CountBytes(folder);
  return statistics;
}

}  // namespace vantrel::elastic
