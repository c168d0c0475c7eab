#include "elastic/repair/checked_directory.h"

#include <algorithm>
#include <string_view>
#include <utility>

#include "elastic/format/commit/file_names.h"

namespace vantrel::elastic {
namespace {

// The segment that a file belongs to alone; empty where there is none.
std::string_view OwnSegment(std::string_view name) {
  const std::string_view extension = name.substr(std::min(name.find('.'), name.size()));
  if (extension == ".cfx" || format::IsStoreExtension(extension)) return {};
  return format::SegmentOfFile(name);
}

}  // namespace

CheckedDirectory::CheckedDirectory(const std::string& path, std::set<std::string> condemned)
    : DiskDirectory(path), condemned_(std::move(condemned)) {}

Lucene::IndexInputPtr CheckedDirectory::openInput(const Lucene::String& name, int32_t buffer_size) {
  Refuse(name);
  return DiskDirectory::openInput(name, buffer_size);
}

void CheckedDirectory::Refuse(const Lucene::String& name) const {
  const std::string own_name = Lucene::StringUtils::toUTF8(name);
  if (!condemned_.contains(std::string(OwnSegment(own_name)))) return;
  boost::throw_exception(Lucene::CorruptIndexException(name + L" belongs to a segment that cannot be read"));
}

}  // namespace vantrel::elastic
