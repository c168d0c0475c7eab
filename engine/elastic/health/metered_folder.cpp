#include "elastic/health/metered_folder.h"

#include <span>
#include <utility>

namespace vantrel::elastic::health {
namespace {

// Bytes between two calls of the callback.
constexpr uint64_t kStep = uint64_t{4} << 20;

class MeteredSource : public format::ByteSource {
 public:
  MeteredSource(std::shared_ptr<const format::ByteSource> source, Meter& meter)
      : source_(std::move(source)), meter_(meter) {}

  const std::string& name() const override { return source_->name(); }
  uint64_t size() const override { return source_->size(); }
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    source_->ReadAt(offset, out);
    meter_.AddRead(out.size());
  }

 private:
  std::shared_ptr<const format::ByteSource> source_;
  Meter& meter_;
};

}  // namespace

void Meter::AddOpened(const format::ByteSource& file) {
  const std::lock_guard lock(opening_);
  if (files_.insert(file.name()).second) opened_ += file.size();
}

std::vector<std::string> Meter::TakeFiles() {
  const std::lock_guard lock(opening_);
  std::vector<std::string> taken(files_.begin(), files_.end());
  files_.clear();
  return taken;
}

void Meter::AddRead(uint64_t bytes) {
  const uint64_t read = read_ += bytes;
  if (!callback_) return;
  uint64_t told = told_;
  // Another thread may have read, and told, more since.
  if (read > told && read - told >= kStep && told_.compare_exchange_strong(told, read)) Tell();
}

void Meter::Tell() {
  if (!callback_) return;
  const std::lock_guard lock(calling_);
  callback_({.segments = segments_,
             .segments_opened = segments_opened_,
             .bytes_read = read_,
             .bytes_opened = opened_});
}

std::shared_ptr<const format::ByteSource> MeteredFolder::Open(const std::string& name) const {
  auto source = folder_.Open(name);
  meter_.AddOpened(*source);
  return std::make_shared<MeteredSource>(std::move(source), meter_);
}

}  // namespace vantrel::elastic::health
