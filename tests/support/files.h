#pragma once

#include <string>
#include <vector>

namespace quorelastic::testing {

// Whole files, as bytes. All of these throw std::runtime_error where the file system refuses.
std::string ReadFile(const std::string& path);
void WriteFile(const std::string& path, const std::string& bytes);

// The names in a folder, sorted.
std::vector<std::string> ListFolder(const std::string& path);

// The name in a folder that ends in `ending`; there must be exactly one.
std::string FindFile(const std::string& folder, const std::string& ending);

void CopyFolder(const std::string& from, const std::string& to);

}  // namespace quorelastic::testing
