#pragma once

#include <optional>
#include <string>
#include <vector>

#include "elastic/format/io/folder.h"
#include "elastic/index/byte_path_directory.h"
#include "elastic/lookup/opened_segment.h"
#include "elastic/lookup/opening_check.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::lookup {

// The folder of an index as the index library opens it to read: each file is checked when it is asked for, and what
// the library then reads is the very file that was checked, whatever a writer does meanwhile. Nothing is created,
// locked or changed. Exceptions are the library's own. For one thread at a time.
//
// Where the newest commit cannot be opened, the library takes the one before, whatever the reason. So nothing is opened
// any more once the system has refused to open or to read a file, but for segments.gen, which is only a hint.
class ReadingDirectory : public BytePathDirectory {
 public:
  // `path` is used byte for byte. PrepareIndexLibrary() must have been called.
  ReadingDirectory(const std::string& path, std::optional<WantedTerm> term);

  // As OpeningCheck has them.
  std::vector<OpenedSegment> TakeSegments() { return check_.TakeSegments(); }

  Lucene::IndexInputPtr openInput(const Lucene::String& name) override;
  Lucene::IndexInputPtr openInput(const Lucene::String& name, int32_t buffer_size) override;

 private:
  std::shared_ptr<const format::ByteSource> Open(const std::string& name);
  void NoteRefusal(const std::string& name, const IndexError& error);

  std::string path_;
  std::optional<format::DiskFolder> folder_;
  OpeningCheck check_;
  std::optional<IndexIoError> refusal_;
};

}  // namespace vantrel::elastic::lookup
