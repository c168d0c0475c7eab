#include "error/error.h"

#include <sstream>

namespace vantrel {
namespace {

std::string ComposeMessage(Error::ErrorCode code, const std::string& reason) {
  std::ostringstream message;
  message << "Vantrel error, code=" << static_cast<int>(code);
  if (!reason.empty()) message << ", reason=[" << reason << "]";
  return message.str();
}

}  // namespace

Error::Error(ErrorCode error_code)
    : std::runtime_error(ComposeMessage(error_code, std::string())), code(error_code) {}

Error::Error(ErrorCode error_code, const std::string& error_reason)
    : std::runtime_error(ComposeMessage(error_code, error_reason)), code(error_code), reason(error_reason) {}

Error::~Error() = default;

const char* Error::what() const noexcept { return reason.c_str(); }

}  // namespace vantrel
