// "check" against the index library's own checker on a healthy index, whole processes, as ratios in one run.

#include <cstdint>
#include <string>
#include <vector>

#include "support/figures.h"
#include "support/run_benchmark.h"
#include "support/timed_run.h"

namespace {

using quorelastic::bench::Compare;
using quorelastic::bench::Comparison;
using quorelastic::bench::Figures;
using quorelastic::bench::Run;

constexpr int64_t kMebibyte = 1 << 20;
constexpr int kRuns = 5;

bool Measure(const std::string& folder) {
  const std::string index = folder + "/index";
  Run({QUORELASTIC_MAKE_DOCUMENTS, index, "320"});
  const std::vector<std::string> check = {QUORELASTIC_TOOL, "-a", "check", "-d", index};
  std::vector<std::string> on_one = {"/usr/bin/taskset", "--cpu-list", "0"};
  on_one.insert(on_one.end(), check.begin(), check.end());
  const std::vector<std::string> peer = {QUORELASTIC_PEER_LIBRARY_CHECK, index};

  Figures figures;
  figures.AddRatio("check of an index of 320 MiB on one processor, against the index library's checker",
                   Compare(on_one, peer, kRuns), 0.1);
  const Comparison all = Compare(check, peer, kRuns);
  figures.AddRatio("the same on all processors", all, 0.06);
  figures.AddPeak("peak memory of check", all.ours.peak_bytes, 64 * kMebibyte);
  return figures.all_met();
}

}  // namespace

int main() { return quorelastic::bench::RunBenchmark(Measure); }
