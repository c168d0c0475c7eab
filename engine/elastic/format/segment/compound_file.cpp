#include "elastic/format/segment/compound_file.h"

#include <algorithm>
#include <utility>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/name_budget.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

class PartSource : public ByteSource {
 public:
  PartSource(std::shared_ptr<const ByteSource> whole, const std::string& name, uint64_t offset, uint64_t size)
      : whole_(std::move(whole)), name_(whole_->name() + " (" + name + ")"), offset_(offset), size_(size) {}

  const std::string& name() const override { return name_; }
  uint64_t size() const override { return size_; }
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    whole_->ReadAt(offset_ + offset, out);
  }

 private:
  std::shared_ptr<const ByteSource> whole_;
  std::string name_;
  uint64_t offset_;
  uint64_t size_;
};

}  // namespace

CompoundFile::CompoundFile(std::shared_ptr<const ByteSource> source) : source_(std::move(source)) {
  ByteReader reader(source_);
  Part* last = nullptr;
  uint64_t first_offset = reader.size();
  uint64_t last_offset = 0;
  NameBudget budget;
  const uint32_t count = reader.ReadVInt();
  if (count > kMostSubFiles) reader.Damaged(0, std::to_string(count) + " sub-files are too many");
  for (uint32_t left = count; left > 0; --left) {
    const uint64_t start = reader.offset();
    const int64_t offset = reader.ReadLong();
    if (offset < 0 || static_cast<uint64_t>(offset) > reader.size() ||
        static_cast<uint64_t>(offset) < last_offset) {
      reader.Damaged(start, "sub-file begins at " + std::to_string(offset) + ", but must lie between " +
                                std::to_string(last_offset) + " and " + std::to_string(reader.size()));
    }
    if (last != nullptr) last->size = static_cast<uint64_t>(offset) - last->offset;
    last_offset = static_cast<uint64_t>(offset);
    first_offset = std::min(first_offset, last_offset);
    std::string name = reader.ReadString();
    budget.Take(reader, start, name);
    const auto [part, is_new] = parts_.try_emplace(std::move(name), Part{last_offset, 0});
    if (!is_new) reader.Damaged(start, "sub-file bears the name of one before");
    if (reader.offset() > first_offset) {
      reader.Damaged(start, "table reaches into the first sub-file at " + std::to_string(first_offset));
    }
    last = &part->second;
  }
  if (last != nullptr) last->size = reader.size() - last->offset;
  table_end_ = reader.offset();
  first_offset_ = first_offset;
}

std::vector<std::string> CompoundFile::Names() const {
  std::vector<std::string> names;
  names.reserve(parts_.size());
  for (const auto& [name, part] : parts_) names.push_back(name);
  return names;
}

std::shared_ptr<const ByteSource> CompoundFile::Open(const std::string& name) const {
  const auto part = parts_.find(name);
  if (part == parts_.end()) throw IndexError(source_->name(), "compound file holds no '" + name + "'");
  return std::make_shared<PartSource>(source_, name, part->second.offset, part->second.size);
}

}  // namespace vantrel::elastic::format
