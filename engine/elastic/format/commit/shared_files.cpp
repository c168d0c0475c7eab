#include "elastic/format/commit/shared_files.h"

#include <algorithm>
#include <string_view>

#include "elastic/format/commit/file_names.h"

namespace vantrel::elastic::format {

const std::vector<std::string>& SharedFiles::Norms() {
  if (!is_listed_) {
    for (std::string& name : folder_.List()) {
      if (IsNormsExtension(ExtensionOf(name))) norms_.push_back(std::move(name));
    }
    std::sort(norms_.begin(), norms_.end());
    is_listed_ = true;
  }
  return norms_;
}

std::span<const std::string> SharedFiles::NormsOf(const std::string& segment) {
  const std::string start = segment + ".";
  const auto is_before = [](const std::string& name, std::string_view wanted) {
    return std::string_view(name).substr(0, wanted.size()) < wanted;
  };
  const auto is_behind = [](std::string_view wanted, const std::string& name) {
    return wanted < std::string_view(name).substr(0, wanted.size());
  };
  const auto& all = Norms();
  const auto begin = std::lower_bound(all.begin(), all.end(), std::string_view(start), is_before);
  return {begin, std::upper_bound(begin, all.end(), std::string_view(start), is_behind)};
}

bool SharedFiles::HasNorms(const std::string& name) {
  const auto& all = Norms();
  return std::binary_search(all.begin(), all.end(), name);
}

}  // namespace vantrel::elastic::format
