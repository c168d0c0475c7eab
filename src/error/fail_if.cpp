#include "error/fail_if.h"

#include <syslog.h>
#include <unistd.h>

#include <cerrno>

// %m is no standard conversion of printf, but one of syslog.
#pragma GCC diagnostic ignored "-Wformat"

namespace vantrel {

void FailCheck(const CheckSite& site, Error::ErrorCode code, const std::string& reason) {
  const int cause = errno;
  const Error error(code, reason);
  const pid_t process = getpid();
  const uid_t user = geteuid();
  if (cause != 0) {
    errno = cause;  // %m reads it
    syslog(LOG_ERR, "%s:%d (%d, %u) (%s) Failed [%s], reason: %s [err: %m]", site.file, site.line, process,
           user, site.function, site.condition, error.what());
    errno = 0;
  } else {
    syslog(LOG_ERR, "%s:%d (%d, %u) (%s) Failed [%s], reason: %s", site.file, site.line, process, user,
           site.function, site.condition, error.what());
    errno = cause;  // the check leaves it as it was
  }
  throw Error(code, reason);
}

}  // namespace vantrel
