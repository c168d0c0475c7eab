#include "daemon/file_category.h"

#include "vantrel/elastic/file_category.h"

namespace {

std::map<std::string, std::string> MakeMap() {
  std::map<std::string, std::string> map;
  for (const auto& category : vantrel::elastic::kFileCategories) {
    map.emplace(category.name, category.extensions);
  }
  return map;
}

}  // namespace

const std::map<std::string, std::string> FileCategoryMap = MakeMap();
