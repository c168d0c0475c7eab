#pragma once

#include <string>

#include "error/error.h"

namespace vantrel {

// Where a failure check stands, and what it tests.
struct CheckSite {
  const char* file;  // without folder
  int line;
  const char* function;
  const char* condition;
};

// Writes the failure's line to the system log, then throws vantrel::Error. While errno is set, the line ends
// with its text, and errno is cleared.
[[noreturn]] void FailCheck(const CheckSite& site, Error::ErrorCode code, const std::string& reason);

}  // namespace vantrel

// Rejects an input: where `condition` holds, the check is logged with the place and the text of the
// condition, and vantrel::Error(code, reason) is thrown.
#define FailIf(condition, code, reason)                                                                 \
  do {                                                                                                  \
    if (condition) ::vantrel::FailCheck({__FILE_NAME__, __LINE__, __func__, #condition}, code, reason); \
  } while (false)
