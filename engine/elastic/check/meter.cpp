#include "elastic/check/meter.h"

namespace vantrel::elastic::check {

void Meter::NoteOpened(const format::ByteSource& file) {
  {
    const std::lock_guard lock(opening_);
    if (files_.insert(file.name()).second) opened_ += file.size();
  }
  ReportIfDue();
}

void Meter::NoteRead(uint64_t bytes) {
  read_ += bytes;
  ReportIfDue();
}

std::vector<std::string> Meter::TakeFiles() {
  const std::lock_guard lock(opening_);
  std::vector<std::string> taken(files_.begin(), files_.end());
  files_.clear();
  return taken;
}

void Meter::ReportIfDue() {
  if (!callback_) return;
  const Clock::time_point now = Clock::now();
  Clock::rep due = due_;
  // One thread reports for all; but each of them ends where the callback has thrown.
  const bool is_due = now.time_since_epoch().count() >= due &&
                      due_.compare_exchange_strong(due, (now + kInterval).time_since_epoch().count());
  if (is_due || is_stopped_) Report();
}

void Meter::Report() {
  if (!callback_) return;
  const std::lock_guard lock(calling_);
  if (stop_ != nullptr) std::rethrow_exception(stop_);
  try {
    callback_({.segments = segments_,
               .segments_opened = segments_opened_,
               .bytes_read = read_,
               .bytes_opened = opened_});
  } catch (...) {
    stop_ = std::current_exception();
    is_stopped_ = true;
    throw;
  }
}

}  // namespace vantrel::elastic::check
