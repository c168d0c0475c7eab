#include "support/repository.h"

#include <filesystem>
#include <regex>

#include "support/files.h"

namespace quorelastic::testing {

std::string RepositoryPath(const std::string& path) { return std::string(QUORELASTIC_REPOSITORY "/") + path; }

std::set<std::string> FindInSources(const std::string& folder, const std::string& pattern) {
  std::set<std::string> found;
  const std::regex regex(pattern);
  for (const auto& entry : std::filesystem::recursive_directory_iterator(RepositoryPath(folder))) {
    if (entry.path().extension() != ".cpp") continue;
    const std::string text = ReadFile(entry.path().string());
    for (std::sregex_iterator match(text.begin(), text.end(), regex), end; match != end; ++match) {
      found.insert((*match)[1]);
    }
  }
  return found;
}

}  // namespace quorelastic::testing
