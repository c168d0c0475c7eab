#pragma once

#include <set>
#include <string>

#include "elastic/index/disk_directory.h"

namespace vantrel::elastic {

// The folder of an index as the checker is to see it: the files of condemned segments cannot be opened, so that it
// takes these for bad without reading them. Stored fields and term vectors stay open to it, as other segments may
// share them.
class CheckedDirectory : public DiskDirectory {
 public:
  // `path` is as DiskDirectory takes it; `condemned` holds names of segments, such as "_3".
  CheckedDirectory(const std::string& path, std::set<std::string> condemned);

  using DiskDirectory::openInput;  // comes down to the other
  Lucene::IndexInputPtr openInput(const Lucene::String& name, int32_t buffer_size) override;

 private:
  void Refuse(const Lucene::String& name) const;

  std::set<std::string> condemned_;
};

}  // namespace vantrel::elastic
