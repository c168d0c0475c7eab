#pragma once

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/types.h>
#include <unistd.h>

#include <cstddef>
#include <filesystem>
#include <iterator>
#include <string>
#include <vector>

#include "support/descriptor.h"

namespace quorelastic::testing {

// How many files a process has open; of this one, without what it takes to look.
inline size_t CountOpenFiles(pid_t process = getpid()) {
  const std::filesystem::directory_iterator all("/proc/" + std::to_string(process) + "/fd");
  const auto count = static_cast<size_t>(std::distance(begin(all), end(all)));
  return process == getpid() ? count - 1 : count;
}

// Leaves this process room for `more` open files while it lives. The limit is about their numbers, the lowest free one is
// taken first, and a program may be started with high ones open: so the numbers are tried out.
class FewOpenFiles {
 public:
  explicit FewOpenFiles(size_t more) {
    std::vector<Descriptor> next;
    while (next.size() <= more) next.emplace_back(open("/dev/null", O_RDONLY | O_CLOEXEC));
    getrlimit(RLIMIT_NOFILE, &before_);
    const rlimit lower = {static_cast<rlim_t>(next.back().get()), before_.rlim_max};
    setrlimit(RLIMIT_NOFILE, &lower);
  }
  FewOpenFiles(const FewOpenFiles&) = delete;
  FewOpenFiles& operator=(const FewOpenFiles&) = delete;
  ~FewOpenFiles() { setrlimit(RLIMIT_NOFILE, &before_); }

 private:
  rlimit before_{};
};

}  // namespace quorelastic::testing
