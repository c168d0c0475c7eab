#pragma once

#include <gtest/gtest.h>

#include <string>

#include "support/files.h"

namespace quorelastic::testing {

// The file of a package that packaging/make-packages has made.
inline std::string PathOf(const std::string& package) {
  for (const std::string& file : ListFolder(PACKAGES_FOLDER)) {
    if (file.starts_with(package + "_")) return std::string(PACKAGES_FOLDER) + "/" + file;
  }
  ADD_FAILURE() << package << " has not been made";
  return "";
}

}  // namespace quorelastic::testing
