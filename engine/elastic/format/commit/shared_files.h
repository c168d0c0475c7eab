#pragma once

#include <exception>
#include <map>
#include <span>
#include <string>
#include <vector>

#include "elastic/format/io/folder.h"

namespace vantrel::elastic::format {

// What the segments of one commit share, so that none of them looks for it again: the names in their folder, which
// is listed once, and which document stores cannot be used. For one thread at a time.
class SharedFiles {
 public:
  // Lists nothing yet. `folder` must outlive it.
  explicit SharedFiles(const Folder& folder) : folder_(folder) {}

  // The files with the norms of one field that a segment has without a generation, such as "_0.f3" and "_0.s3":
  // the older layouts do not say which there are. Throws IndexIoError.
  std::span<const std::string> NormsOf(const std::string& segment);

  // Whether there is a file of this name with the norms of one field, such as "_0_2.s3". Throws IndexIoError.
  bool HasNorms(const std::string& name);

  // Why the compound file of a document store cannot be used, by the store's name. Empty where that is not known.
  std::map<std::string, std::exception_ptr>& store_failures() { return store_failures_; }

 private:
  const std::vector<std::string>& Norms();

  const Folder& folder_;
  bool is_listed_ = false;
  std::vector<std::string> norms_;  // sorted
  std::map<std::string, std::exception_ptr> store_failures_;
};

}  // namespace vantrel::elastic::format
