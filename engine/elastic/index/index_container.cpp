#include "vantrel/elastic/index_container.h"
#include "elastic/common/path.h"

#include "elastic/format/io/folder.h"
#include "vantrel/elastic/index.h"

namespace vantrel::elastic {

const std::string& IndexRoot() {
  static const std::string root = QUORELASTIC_DATA_ROOT;
  return root;
}

std::shared_ptr<IndexContainer> IndexContainer::Instance() {
  static const auto instance = std::make_shared<IndexContainer>();
  return instance;
}

std::shared_ptr<Index> IndexContainer::IndexGet(const std::string& name) {
  const std::string path = name.find('/') != std::string::npos ? name : JoinPath(IndexRoot(), name);
  const std::lock_guard guard(mutex_);
  std::erase_if(indexes_, [](const auto& entry) { return entry.second.expired(); });
  std::weak_ptr<Index>& known = indexes_[path];
  std::shared_ptr<Index> index = known.lock();
  if (index == nullptr) {
    index = Index::OpenLater(path);
    known = index;
  }
  return index;
}

}  // namespace vantrel::elastic
