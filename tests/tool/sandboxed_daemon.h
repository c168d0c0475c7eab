#pragma once

#include <signal.h>

#include <chrono>
#include <stdexcept>
#include <string>
#include <thread>

#include "support/files.h"
#include "support/sandbox.h"
#include "support/tool_run.h"

namespace quorelastic::testing {

// The real daemon, serving at the fixed places of a sandbox as long as it lives.
class SandboxedDaemon {
 public:
  // `program` is its path. Waits until it serves; throws std::runtime_error with what it said where it does not.
  SandboxedDaemon(const Sandbox& sandbox, const std::string& program) : process_(sandbox.Start({program})) {
    const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (process_.Err().find("serves on /var/run/quorelasticd.sock") == std::string::npos) {
      if (std::chrono::steady_clock::now() > give_up)
        throw std::runtime_error("no daemon: " + process_.Err());
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    pid_ = std::stoi(ReadFile(sandbox.folder() + "/pid"));  // of what was started last
  }

  // Asks it to end, and gives its status.
  int Stop() {
    if (kill(pid_, SIGTERM) != 0) throw std::runtime_error("the daemon is gone: " + process_.Err());
    return process_.Wait().status;
  }

 private:
  Process process_;
  pid_t pid_ = 0;
};

}  // namespace quorelastic::testing
