#include "health/health_run.h"

#include <algorithm>
#include <stdexcept>
#include <thread>

#include "base/limits.h"

namespace quorelasticd {
namespace {

// All checks together take half of the processors, for searches go on.
unsigned ThreadsOfACheck() {
  constexpr auto kShares = static_cast<unsigned>(2 * kMostHealthRuns);
  return std::max(1U, std::thread::hardware_concurrency() / kShares);
}

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
