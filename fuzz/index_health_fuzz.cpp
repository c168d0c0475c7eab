#include "elastic/health/index_check.h"
#include "fuzz_input.h"

using quorelastic::fuzz::Require;
using vantrel::elastic::HealthFinding;
using vantrel::elastic::HealthReport;

// A folder: file after file, each a byte for the length of its name, the name, two bytes for its length, its bytes.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  quorelastic::fuzz::FuzzInput input(data, size);
  quorelastic::testing::MemoryFolder folder;
  while (input.left() > 0) {
    std::string name;
    for (int left = input.TakeByte(); left > 0; --left) name.push_back(static_cast<char>(input.TakeByte()));
    const uint32_t length = input.TakeNumber();
    folder.files[name].bytes = input.TakeBytes(length);
  }
  const HealthReport report = vantrel::elastic::health::CheckFolder(folder, {.threads = 1});
  for (const HealthFinding& finding : report.findings) {
    Require(finding.file.starts_with("memory"), "a finding names a file of the folder");
    Require(!finding.expected.empty() && !finding.found.empty(), "a finding tells what is wrong");
  }
  Require(report.generation >= 0 || !report.clean(), "a folder without a commit is not clean");
  return 0;
}
