#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic::health {

using Grade = HealthFinding::Grade;

// What a check throws at the first thing that is not as it should be: past it, the file's structure is unknown.
class Mismatch : public std::runtime_error {
 public:
  explicit Mismatch(HealthFinding finding)
      : std::runtime_error(finding.file + ": expected " + finding.expected + ", found " + finding.found),
        finding_(std::move(finding)) {}

  const HealthFinding& finding() const { return finding_; }

 private:
  HealthFinding finding_;
};

[[noreturn]] inline void Refuse(Grade grade, const std::string& file, uint64_t offset, std::string expected,
                                std::string found) {
  throw Mismatch({.file = file,
                  .offset = offset,
                  .expected = std::move(expected),
                  .found = std::move(found),
                  .grade = grade});
}

// Refuses a number that is not the one it should be; `what` says what it is.
inline void RequireEqual(Grade grade, const std::string& file, uint64_t offset, const char* what,
                         uint64_t expected, uint64_t found) {
  if (expected == found) return;
  Refuse(grade, file, offset, std::string(what) + " " + std::to_string(expected), std::to_string(found));
}

}  // namespace vantrel::elastic::health
