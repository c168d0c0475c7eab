#pragma once

#include <stdexcept>
#include <string>

namespace vantrel {

// What the tool throws when it rejects its input.
class Error : public std::runtime_error {
 public:
  enum ErrorCode : int {
    kInvalidInput = 120,    // an option is missing or has an impossible value
    kUnloadableJson = 504,  // a JSON file is missing, unreadable or malformed
  };

  explicit Error(ErrorCode error_code);
  Error(ErrorCode error_code, const std::string& error_reason);
  Error(const Error&) = default;
  Error& operator=(const Error&) = default;
  ~Error() override;

  // The bare reason, which is what a user reads. The composed message, with the code, stays in the base.
  const char* what() const noexcept override;

  ErrorCode code;
  std::string reason;
};

}  // namespace vantrel
