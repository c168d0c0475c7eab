#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic::check {

using Grade = HealthFinding::Grade;

// What a check throws at the first thing that is not as it should be: past it, the file's structure is unknown.
class Mismatch : public std::runtime_error {
 public:
  explicit Mismatch(HealthFinding finding);

  const HealthFinding& finding() const { return finding_; }

 private:
  HealthFinding finding_;
};

[[noreturn]] void Refuse(Grade grade, const std::string& file, uint64_t offset, std::string expected,
                         std::string found);

[[noreturn]] void RefuseNumber(Grade grade, const std::string& file, uint64_t offset, const char* what,
                               uint64_t expected, uint64_t found);

// Refuses a number that is not the one it should be; `what` says what it is.
inline void RequireEqual(Grade grade, const std::string& file, uint64_t offset, const char* what,
                         uint64_t expected, uint64_t found) {
  if (expected != found) RefuseNumber(grade, file, offset, what, expected, found);
}

}  // namespace vantrel::elastic::check
