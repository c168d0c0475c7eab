#include "support/temporary_folder.h"

#include <cstdlib>
#include <filesystem>
#include <system_error>

namespace quorelastic::testing {

TemporaryFolder::TemporaryFolder() {
  path_ = (std::filesystem::temp_directory_path() / "quorelastic-test-XXXXXX").string();
  if (mkdtemp(path_.data()) == nullptr) {
    throw std::system_error(errno, std::generic_category(), "cannot create " + path_);
  }
}

TemporaryFolder::~TemporaryFolder() {
  std::error_code ignored;
  std::filesystem::remove_all(path_, ignored);
}

}  // namespace quorelastic::testing
