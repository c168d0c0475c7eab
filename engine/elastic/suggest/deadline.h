#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

#include "elastic/common/deadline_after.h"
#include "elastic/format/io/watched_folder.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

// Ends the reading of files by SearchTimeoutError once a time limit is over.
class Deadline : public format::ReadWatcher {
 public:
  // Counted from now; 0 is never.
  explicit Deadline(std::chrono::milliseconds time_limit) : end_(DeadlineAfter(time_limit)) {}

  void NoteOpened(const format::ByteSource& /*file*/) override { Check(); }
  void NoteRead(uint64_t /*bytes*/) override { Check(); }

 private:
  void Check() const {
    if (end_.has_value() && std::chrono::steady_clock::now() > *end_) throw SearchTimeoutError();
  }

  std::optional<std::chrono::steady_clock::time_point> end_;
};

}  // namespace vantrel::elastic
