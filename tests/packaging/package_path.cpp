#include "packaging/package_path.h"

#include <gtest/gtest.h>

#include "support/files.h"

namespace quorelastic::testing {

std::vector<std::string> PackageFiles() { return ListFolder(PACKAGES_FOLDER); }

std::string PathOf(const std::string& package) {
  for (const std::string& file : PackageFiles()) {
    if (file.starts_with(package + "_")) return std::string(PACKAGES_FOLDER) + "/" + file;
  }
  ADD_FAILURE() << package << " has not been made";
  return "";
}

}  // namespace quorelastic::testing
