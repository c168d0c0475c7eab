#include "shutdown_watch.h"

#include <spdlog/spdlog.h>
#include <unistd.h>

#include <exception>

namespace quorelasticd {

void ShutdownWatch::Start() noexcept {
  try {
    thread_ = std::thread([this] { Wait(); });
  } catch (const std::exception& error) {
    spdlog::warn("nobody watches that the daemon ends in time: {}", error.what());
  }
}

void ShutdownWatch::Stop() {
  {
    const std::lock_guard lock(mutex_);
    is_stopped_ = true;
  }
  stopped_.notify_all();
  if (thread_.joinable()) thread_.join();
}

void ShutdownWatch::Wait() {
  std::unique_lock lock(mutex_);
  if (stopped_.wait_for(lock, limit_, [this] { return is_stopped_; })) return;
  spdlog::critical("what still runs does not end in time: giving up; what was not committed is lost");
  spdlog::shutdown();
  _exit(1);
}

}  // namespace quorelasticd
