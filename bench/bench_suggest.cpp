// Suggestions against their peers, whole processes, as ratios in one run.

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

const std::string kTool = QUORELASTIC_TOOL;

std::vector<std::string> Suggest(const std::string& index, const std::string& prefix) {
  return {kTool, "-a", "term_suggest", "-d", index, "-f", "body", "-t", prefix};
}

bool Measure(const std::string& folder) {
  const std::string index = folder + "/index";
  Run({QUORELASTIC_MAKE_TERMS, index, "600000"});

  Figures figures;
  const Comparison all =
      Compare(Suggest(index, "t"), {QUORELASTIC_PEER_LIBRARY_SCAN, index, "body", "t"}, 21);
  figures.AddRatio("the ten best of 600,000 terms with one letter, against a plain scan by the index library",
                   all, 0.5);
  figures.AddRatio("the ten best for four letters, against opening the dictionary",
                   Compare(Suggest(index, "t1k0"), {kTool, "-a", "allterm", "-d", index}, 101), 1.5);
  figures.AddInformation("the ten best for four letters, against a run that does nothing",
                         Compare(Suggest(index, "t1k0"), {kTool, "-a", "plugin"}, 101));
  figures.AddPeak("peak memory of the ten best of 600,000", all.ours.peak_bytes, int64_t{16} << 20);

  const std::string segments = folder + "/segments";
  Run({QUORELASTIC_MAKE_TERMS, segments, "600000", "8"});
  figures.AddRatio(
      "the same in 8 segments, one document in ten deleted, one letter",
      Compare(Suggest(segments, "t"), {QUORELASTIC_PEER_LIBRARY_SCAN, segments, "body", "t"}, 21), 0.5);
  return figures.all_met();
}

}  // namespace

int main() { return quorelastic::bench::RunBenchmark(Measure); }
