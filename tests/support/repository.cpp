#include "support/repository.h"

#include <filesystem>

#include "support/files.h"
#include "support/text_search.h"

namespace quorelastic::testing {

std::string RepositoryPath(const std::string& path) { return std::string(QUORELASTIC_REPOSITORY "/") + path; }

std::set<std::string> FindInSources(const std::string& folder, const std::string& pattern) {
  std::set<std::string> found;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(RepositoryPath(folder))) {
    if (entry.path().extension() != ".cpp") continue;
    for (const auto& match : FindAll(ReadFile(entry.path().string()), pattern)) found.insert(match.back());
  }
  return found;
}

}  // namespace quorelastic::testing
