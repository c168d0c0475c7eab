#include "elastic/format/io/opening_error.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string>

namespace vantrel::elastic::format {

bool IsMissingError(const IndexIoError& error) {
  return error.error_number() == EACCES || error.error_number() == EPERM || IsAbsenceError(error);
}

bool IsAbsenceError(const IndexIoError& error) { return IsAbsence(error.error_number()); }

bool IsAbsence(int error_number) {
  constexpr std::array kErrors = {ENOENT, EISDIR, ENOTDIR, ELOOP, ENAMETOOLONG};
  return std::find(kErrors.begin(), kErrors.end(), error_number) != kErrors.end();
}

FileMissingError AsMissing(const IndexError& error) {
  const std::string what = error.what();
  return {error.path(), what.substr(std::min(what.size(), error.path().size() + 2))};
}

void RethrowOpening(const IndexError& error) {
  const auto* system_error = dynamic_cast<const IndexIoError*>(&error);
  if (system_error != nullptr && !IsMissingError(*system_error)) throw IndexIoError(*system_error);
  throw AsMissing(error);
}

}  // namespace vantrel::elastic::format
