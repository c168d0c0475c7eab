#pragma once

#include <string>
#include <vector>

namespace quorelastic::testing {

// The names of the files of the packages that packaging/make-packages has made.
std::vector<std::string> PackageFiles();

// The path of a package's file. A failure of the test where it has not been made.
std::string PathOf(const std::string& package);

}  // namespace quorelastic::testing
