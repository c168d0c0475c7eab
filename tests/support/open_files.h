#pragma once

#include <sys/resource.h>
#include <sys/types.h>
#include <unistd.h>

#include <cstddef>
#include <filesystem>
#include <iterator>
#include <string>

namespace quorelastic::testing {

// How many files a process has open; of this one, without what it takes to look.
inline size_t CountOpenFiles(pid_t process = getpid()) {
  const std::filesystem::directory_iterator all("/proc/" + std::to_string(process) + "/fd");
  const auto count = static_cast<size_t>(std::distance(begin(all), end(all)));
  return process == getpid() ? count - 1 : count;
}

// Lowers the limit on open files while it lives.
class FewOpenFiles {
 public:
  explicit FewOpenFiles(rlim_t most) {
    getrlimit(RLIMIT_NOFILE, &before_);
    const rlimit lower = {most, before_.rlim_max};
    setrlimit(RLIMIT_NOFILE, &lower);
  }
  FewOpenFiles(const FewOpenFiles&) = delete;
  FewOpenFiles& operator=(const FewOpenFiles&) = delete;
  ~FewOpenFiles() { setrlimit(RLIMIT_NOFILE, &before_); }

 private:
  rlimit before_{};
};

}  // namespace quorelastic::testing
