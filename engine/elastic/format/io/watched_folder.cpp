#include "elastic/format/io/watched_folder.h"

#include <algorithm>
#include <span>
#include <utility>

namespace vantrel::elastic::format {
namespace {

class WatchedSource : public ByteSource {
 public:
  WatchedSource(std::shared_ptr<const ByteSource> source, ReadWatcher& watcher)
      : source_(std::move(source)), watcher_(watcher) {}

  const std::string& name() const override { return source_->name(); }
  uint64_t size() const override { return source_->size(); }
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    do {
      const auto piece = out.first(std::min<uint64_t>(out.size(), WatchedFolder::kLongestRead));
      source_->ReadAt(offset, piece);
      watcher_.NoteRead(piece.size());
      offset += piece.size();
      out = out.subspan(piece.size());
    } while (!out.empty());
  }

 private:
  std::shared_ptr<const ByteSource> source_;
  ReadWatcher& watcher_;
};

}  // namespace

std::shared_ptr<const ByteSource> WatchedFolder::Open(const std::string& name) const {
  auto source = folder().Open(name);
  watcher_.NoteOpened(*source);
  return std::make_shared<WatchedSource>(std::move(source), watcher_);
}

}  // namespace vantrel::elastic::format
