#include "elastic/check/index_check.h"
#include "fuzz_input.h"

using quorelastic::fuzz::Require;
using vantrel::elastic::HealthFinding;
using vantrel::elastic::HealthReport;

// The files of a folder.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  quorelastic::fuzz::FuzzInput input(data, size);
  quorelastic::testing::MemoryFolder folder;
  input.TakeFiles(folder);
  const HealthReport report = vantrel::elastic::check::CheckFolder(folder, {.threads = 1});
  for (const HealthFinding& finding : report.findings) {
    Require(finding.file.starts_with("memory"), "a finding names a file of the folder");
    Require(!finding.expected.empty() && !finding.found.empty(), "a finding tells what is wrong");
  }
  Require(report.generation >= 0 || !report.clean(), "a folder without a commit is not clean");
  return 0;
}
