#include "elastic/repair/checked_directory.h"

#include <algorithm>
#include <array>
#include <string_view>
#include <utility>

#include "elastic/format/file_names.h"

namespace vantrel::elastic {
namespace {

constexpr std::array<std::string_view, 6> kSharedExtensions = {"cfx", "fdt", "fdx", "tvx", "tvd", "tvf"};

// The segment that a file belongs to alone; empty where there is none.
std::string_view OwnSegment(std::string_view name) {
  const std::string_view extension = name.substr(std::min(name.find('.'), name.size() - 1) + 1);
  if (std::find(kSharedExtensions.begin(), kSharedExtensions.end(), extension) != kSharedExtensions.end()) {
    return {};
  }
  return format::SegmentOfFile(name);
}

}  // namespace

CheckedDirectory::CheckedDirectory(const std::string& path, std::set<std::string> condemned)
    : DiskDirectory(path), condemned_(std::move(condemned)) {}

Lucene::IndexInputPtr CheckedDirectory::openInput(const Lucene::String& name) {
  Refuse(name);
  return DiskDirectory::openInput(name);
}

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
