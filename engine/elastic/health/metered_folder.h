#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "elastic/format/folder.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic::health {

// Counts what is opened and read, and tells a callback now and then. Thread-safe.
class Meter {
 public:
  explicit Meter(std::function<void(const HealthProgress&)> callback) : callback_(std::move(callback)) {}

  void AddOpened(const format::ByteSource& file);
  void AddRead(uint64_t bytes);

  // A commit of so many segments is begun.
  void SetSegments(size_t segments) {
    segments_ = segments;
    segments_opened_ = 0;
  }
  void AddSegmentOpened() { ++segments_opened_; }

  // The paths of what was opened since the last call, sorted.
  std::vector<std::string> TakeFiles();

  // Calls the callback, if there is one, with what is counted so far.
  void Tell();

 private:
  std::function<void(const HealthProgress&)> callback_;
  std::mutex calling_;
  std::mutex opening_;
  std::set<std::string> files_;
  std::atomic<uint64_t> opened_ = 0;
  std::atomic<uint64_t> read_ = 0;
  std::atomic<uint64_t> told_ = 0;
  std::atomic<size_t> segments_ = 0;
  std::atomic<size_t> segments_opened_ = 0;
};

// A folder whose files are metered. Both must outlive it and the files.
class MeteredFolder : public format::Folder {
 public:
  MeteredFolder(const format::Folder& folder, Meter& meter) : folder_(folder), meter_(meter) {}

  const std::string& path() const override { return folder_.path(); }
  std::vector<std::string> List() const override { return folder_.List(); }
  bool Exists(const std::string& name) const override { return folder_.Exists(name); }
  std::shared_ptr<const format::ByteSource> Open(const std::string& name) const override;

 private:
  const format::Folder& folder_;
  Meter& meter_;
};

}  // namespace vantrel::elastic::health
