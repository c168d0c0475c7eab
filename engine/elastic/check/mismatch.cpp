#include "elastic/check/mismatch.h"

#include <utility>

namespace vantrel::elastic::check {

Mismatch::Mismatch(HealthFinding finding)
    : std::runtime_error(finding.file + ": offset " + std::to_string(finding.offset) + ": expected " +
                         finding.expected + ", found " + finding.found),
      finding_(std::move(finding)) {}

void Refuse(Grade grade, const std::string& file, uint64_t offset, std::string expected, std::string found) {
  throw Mismatch({.file = file,
                  .offset = offset,
                  .expected = std::move(expected),
                  .found = std::move(found),
                  .grade = grade});
}

void RefuseNumber(Grade grade, const std::string& file, uint64_t offset, const char* what, uint64_t expected,
                  uint64_t found) {
  Refuse(grade, file, offset, std::string(what) + " " + std::to_string(expected), std::to_string(found));
}

}  // namespace vantrel::elastic::check
