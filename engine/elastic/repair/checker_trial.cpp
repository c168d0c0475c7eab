#include "elastic/repair/checker_trial.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <limits>

#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

constexpr rlim_t kMostMemory = rlim_t{2} << 30;

// A sanitizer takes more address space than that for itself.
#ifdef QUORELASTIC_SANITIZED
constexpr bool kLimitsMemory = false;
#else
constexpr bool kLimitsMemory = true;
#endif

// The checker gets through about a hundred megabytes a second of processor time; a slow processor is given one. Where it
// runs astray, it is for ever, and somebody waits. By the clock there is time for a slow disk too.
constexpr uint64_t kBytesPerSecond = uint64_t{1} << 20;
constexpr suseconds_t kLeastProcessorMicroseconds = 250'000;
constexpr unsigned kLeastSeconds = 60;

int32_t SecondsFor(uint64_t bytes) {
  constexpr uint64_t kMost = std::numeric_limits<int32_t>::max() - kLeastSeconds;
  return static_cast<int32_t>(std::min(bytes / kBytesPerSecond, kMost));
}

[[noreturn]] void RunTrial(const std::function<void()>& operation, uint64_t index_bytes) {
  for (const int signal : {SIGSEGV, SIGABRT, SIGBUS, SIGFPE, SIGALRM, SIGPROF}) std::signal(signal, SIG_DFL);
  const rlimit none = {0, 0};
  setrlimit(RLIMIT_CORE, &none);
  const rlimit memory = {kMostMemory, kMostMemory};
  if (kLimitsMemory) setrlimit(RLIMIT_AS, &memory);
  // What the C library says of a broken heap is for nobody.
  const int nothing = open("/dev/null", O_WRONLY | O_CLOEXEC);
  dup2(nothing, STDERR_FILENO);
  const int32_t seconds = SecondsFor(index_bytes);
  const itimerval processor_time = {{}, {seconds, kLeastProcessorMicroseconds}};
  setitimer(ITIMER_PROF, &processor_time, nullptr);
  alarm(static_cast<unsigned>(seconds) + kLeastSeconds);
  try {
    operation();
  } catch (...) {
    _exit(1);
  }
  _exit(0);
}

}  // namespace

bool SurvivesTrial(const std::string& path, uint64_t index_bytes, const std::function<void()>& operation) {
  const pid_t child = fork();
  if (child < 0) throw IndexIoError(path, "cannot start a process to try the index library in", errno);
  if (child == 0) RunTrial(operation, index_bytes);
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) throw IndexIoError(path, "cannot wait for the trial of the index library", errno);
  }
  // Nothing of ours sends that. Somebody wanted its memory, or its end; of the operation it tells nothing.
  if (WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL) {
    throw IndexIoError(path, "somebody killed the trial of the index library", ECANCELED);
  }
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace vantrel::elastic
