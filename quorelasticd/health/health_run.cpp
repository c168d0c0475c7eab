#include "health/health_run.h"

#include <algorithm>
#include <stdexcept>
#include <thread>

namespace quorelasticd {
namespace {

// Half of the processors, for searches go on.
unsigned ThreadsOfACheck() { return std::max(1U, std::thread::hardware_concurrency() / 2); }

}  // namespace

HealthRun::HealthRun(const std::string& path) {
  const vantrel::elastic::HealthOptions options{
      .threads = ThreadsOfACheck(),
      .progress = [this](const vantrel::elastic::HealthProgress& progress) { Note(progress); }};
  report_ = std::async(std::launch::async,
                       [path, options] { return vantrel::elastic::CheckIndexHealth(path, options); });
}

HealthRun::~HealthRun() { is_given_up_ = true; }

void HealthRun::Note(const vantrel::elastic::HealthProgress& progress) {
  if (is_given_up_) throw std::runtime_error("the check was given up");
  const std::lock_guard lock(mutex_);
  progress_ = progress;
}

vantrel::elastic::HealthProgress HealthRun::progress() const {
  const std::lock_guard lock(mutex_);
  return progress_;
}

}  // namespace quorelasticd
