#include "support/library_checker.h"

#include <fcntl.h>
#include <lucene++/LuceneHeaders.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <system_error>

// Not without the headers above.
#include <lucene++/CheckIndex.h>
#include <lucene++/SegmentInfos.h>

#include "support/child_limits.h"

namespace quorelastic::testing {
namespace {

constexpr int kCleanStatus = 0;
constexpr int kNotCleanStatus = 1;
constexpr int kThrewStatus = 2;

int Check(const std::string& path) {
  try {
    Lucene::SegmentInfos::setDefaultGenFileRetryPauseMsec(0);
    const auto checker = Lucene::newLucene<Lucene::CheckIndex>(
        Lucene::FSDirectory::open(Lucene::StringUtils::toUnicode(path)));
    return checker->checkIndex()->clean ? kCleanStatus : kNotCleanStatus;
  } catch (...) {
    return kThrewStatus;
  }
}

[[noreturn]] void RunChecker(const std::string& path) {
  for (const int signal : {SIGSEGV, SIGABRT, SIGBUS, SIGFPE}) std::signal(signal, SIG_DFL);
  // What the C library says of a corrupt heap belongs to nobody.
  const int nothing = open("/dev/null", O_WRONLY | O_CLOEXEC);
  dup2(nothing, STDERR_FILENO);
  LimitChild();
  _exit(Check(path));
}

}  // namespace

LibraryVerdict CheckWithLibrary(const std::string& path) {
  const pid_t child = fork();
  if (child < 0) throw std::system_error(errno, std::generic_category(), "fork");
  if (child == 0) RunChecker(path);
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) throw std::system_error(errno, std::generic_category(), "waitpid");
  }
  if (!WIFEXITED(status)) return LibraryVerdict::kFailed;
  if (WEXITSTATUS(status) == kCleanStatus) return LibraryVerdict::kClean;
  return WEXITSTATUS(status) == kNotCleanStatus ? LibraryVerdict::kNotClean : LibraryVerdict::kFailed;
}

}  // namespace quorelastic::testing
