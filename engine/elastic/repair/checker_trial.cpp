#include "elastic/repair/checker_trial.h"

#include <fcntl.h>
#include <lucene++/LuceneHeaders.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

// Not without the library's main header.
#include <lucene++/CheckIndex.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <limits>
#include <system_error>

#include "elastic/repair/checked_directory.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;

constexpr rlim_t kMostMemory = rlim_t{2} << 30;

// A sanitizer takes more address space than that for itself.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kLimitsMemory = false;
#else
constexpr bool kLimitsMemory = true;
#endif

// The checker reads tens of megabytes a second; a slow disk is given one.
constexpr uint64_t kBytesPerSecond = uint64_t{1} << 20;
constexpr uint64_t kLeastSeconds = 30;

unsigned TimeFor(uint64_t bytes) {
  return static_cast<unsigned>(
      std::min<uint64_t>(kLeastSeconds + bytes / kBytesPerSecond, std::numeric_limits<int32_t>::max()));
}

[[noreturn]] void RunTrial(const std::string& path, const std::string& segment, unsigned seconds) {
  for (const int signal : {SIGSEGV, SIGABRT, SIGBUS, SIGFPE, SIGALRM}) std::signal(signal, SIG_DFL);
  const rlimit none = {0, 0};
  setrlimit(RLIMIT_CORE, &none);
  const rlimit memory = {kMostMemory, kMostMemory};
  if (kLimitsMemory) setrlimit(RLIMIT_AS, &memory);
  // What the C library says of a broken heap is for nobody.
  const int nothing = open("/dev/null", O_WRONLY | O_CLOEXEC);
  dup2(nothing, STDERR_FILENO);
  alarm(seconds);
  try {
    auto only = Lucene::Collection<Lucene::String>::newInstance();
    only.add(Lucene::StringUtils::toUnicode(segment));
    newLucene<Lucene::CheckIndex>(newLucene<CheckedDirectory>(path, std::set<std::string>()))
        ->checkIndex(only);
  } catch (...) {
    // It would have come through: it catches what it can drop a segment for, and this is no such thing.
    _exit(1);
  }
  _exit(0);
}

}  // namespace

bool CheckerSurvives(const std::string& path, const std::string& segment, uint64_t index_bytes) {
  const pid_t child = fork();
  if (child < 0) throw std::system_error(errno, std::generic_category(), "cannot start a child process");
  if (child == 0) RunTrial(path, segment, TimeFor(index_bytes));
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR)
      throw std::system_error(errno, std::generic_category(), "cannot wait for a child process");
  }
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace vantrel::elastic
