#include "error/fail_if.h"

#include <syslog.h>
#include <unistd.h>

#include <cerrno>

namespace vantrel {

void FailCheck(const CheckSite& site, Error::ErrorCode code, const std::string& reason) {
  const int cause = errno;
  const Error error(code, reason);
  const pid_t process = getpid();
  const uid_t user = geteuid();
  if (cause != 0) {
    errno = cause;  // %m reads it
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat"  // %m is a conversion of syslog, not of printf
    syslog(LOG_ERR, "%s:%d (%d, %u) (%s) Failed [%s], reason: %s [err: %m]", site.file, site.line, process,
           user, site.function, site.condition, error.what());
#pragma GCC diagnostic pop
    errno = 0;
  } else {
    syslog(LOG_ERR, "%s:%d (%d, %u) (%s) Failed [%s], reason: %s", site.file, site.line, process, user,
           site.function, site.condition, error.what());
    errno = cause;  // the check leaves it as it was
  }
  throw Error(code, reason);
}

}  // namespace vantrel
