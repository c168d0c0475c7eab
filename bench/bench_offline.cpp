// The offline inspections against their peers, whole processes, as ratios in one run.

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
using quorelastic::bench::RunIntoFile;

constexpr int64_t kMebibyte = 1 << 20;
constexpr int kManyTerms = 600000;
constexpr int kFewTerms = 6000;

const std::string kTool = QUORELASTIC_TOOL;

std::string MakeIndex(const std::string& folder, int terms) {
  const std::string path = folder + "/" + std::to_string(terms);
  Run({QUORELASTIC_MAKE_TERMS, path, std::to_string(terms)});
  return path;
}

std::vector<std::string> Dump(const std::string& index) {
  return {kTool, "-a", "allterm", "-d", index, "--info", "--max", "100000000"};
}

std::vector<std::string> Count(const std::string& index) { return {kTool, "-a", "allterm", "-d", index}; }

bool Measure(const std::string& folder) {
  const std::string many = MakeIndex(folder, kManyTerms);
  const std::string few = MakeIndex(folder, kFewTerms);
  const std::string lines = folder + "/lines";
  RunIntoFile(Dump(many), lines);

  Figures figures;
  figures.AddRatio("a run that does nothing, against one that only links",
                   Compare({kTool, "-a", "plugin"}, {QUORELASTIC_PEER_LINK_ONLY}, 101), 1.2);
  const Comparison dump = Compare(Dump(many), {QUORELASTIC_PEER_WRITE_LINES, lines}, 15);
  figures.AddRatio("allterm --info, 600,000 terms, against writing the same lines", dump, 2.0);
  figures.AddInformation(
      "the index library's enumerator, against writing the same lines",
      Compare({QUORELASTIC_PEER_LIBRARY_TERMS, many}, {QUORELASTIC_PEER_WRITE_LINES, lines}, 5));
  figures.AddRatio("allterm without --info, 600,000 terms against 6,000",
                   Compare(Count(many), Count(few), 101), 1.1);
  figures.AddPeak("peak memory of allterm --info", dump.ours.peak_bytes, 32 * kMebibyte);
  return figures.all_met();
}

}  // namespace

int main() { return quorelastic::bench::RunBenchmark(Measure); }
