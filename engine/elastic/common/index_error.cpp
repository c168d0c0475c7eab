#include "vantrel/elastic/index_error.h"

#include <system_error>

namespace vantrel::elastic {

IndexError::IndexError(const std::string& path, const std::string& problem)
    : std::runtime_error((path.empty() ? "(empty path)" : path) + ": " + problem), path_(path) {}

IndexIoError::IndexIoError(const std::string& path, const std::string& problem, int error_number)
    : IndexError(path, problem + ": " + std::generic_category().message(error_number)),
      error_number_(error_number) {}

IndexDamagedError::IndexDamagedError(const std::string& path, uint64_t offset, const std::string& problem)
    : IndexError(path, "offset " + std::to_string(offset) + ": " + problem), offset_(offset) {}

IndexExistsError::IndexExistsError(const std::string& path)
    : IndexError(path, "there is an index in this folder already") {}

IndexLockedError::IndexLockedError(const std::string& path)
    : IndexError(path, "the index is open for writing elsewhere") {}

IndexChangesLostError::IndexChangesLostError(const std::string& path)
    : IndexError(path, "changes since the last commit were lost when a later one failed") {}

}  // namespace vantrel::elastic
