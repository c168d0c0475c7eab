#include "vantrel/elastic/write_lock.h"

#include <utility>

#include "elastic/common/file_lock.h"
#include "elastic/common/path.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

WriteLock::WriteLock(const std::string& folder) {
  auto lock = FileLock::TryLock(JoinPath(folder, kFileName), 0666);
  if (!lock.has_value()) throw IndexLockedError(folder);
  lock_ = std::make_unique<FileLock>(std::move(*lock));
}

WriteLock::WriteLock(WriteLock&& other) noexcept = default;

WriteLock& WriteLock::operator=(WriteLock&& other) noexcept = default;

WriteLock::~WriteLock() = default;

}  // namespace vantrel::elastic
