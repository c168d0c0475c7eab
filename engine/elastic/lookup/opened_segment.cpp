#include "elastic/lookup/opened_segment.h"

#include <algorithm>

namespace vantrel::elastic::lookup {
namespace {

OpenedSegment::Source Find(const std::map<std::string, OpenedSegment::Source>& files,
                           const std::string& extension) {
  const auto file = files.find(extension);
  return file == files.end() ? nullptr : file->second;
}

OpenedSegment::Source FindPart(const format::CompoundFile& compound, const std::string& name) {
  return compound.Exists(name) ? compound.Open(name) : nullptr;
}

}  // namespace

OpenedSegment::Source OpenedSegment::Core(const std::string& extension) const {
  return compound.has_value() ? FindPart(*compound, info.name + extension) : Find(plain, extension);
}

OpenedSegment::Source OpenedSegment::Store(const std::string& extension) const {
  if (has_own_store() && compound.has_value()) return FindPart(*compound, info.name + extension);
  if (!has_own_store() && store_compound.has_value()) {
    return FindPart(*store_compound, info.store_segment + extension);
  }
  return Find(plain_store, extension);
}

const format::FieldInfo* OpenedSegment::FindField(const std::string& name) const {
  const auto found =
      std::find_if(fields.begin(), fields.end(), [&](const auto& field) { return field.name == name; });
  return found == fields.end() ? nullptr : &*found;
}

}  // namespace vantrel::elastic::lookup
