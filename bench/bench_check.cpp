// "check" against the index library's own checker on a healthy index, and the lookups that are checked beforehand
// against the library's without; whole processes, as ratios in one run.

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
constexpr int kLookups = 101;

// The most frequent word is in nearly every document, and each lookup goes to the middle of the index.
void MeasureLookups(const std::string& index, Figures& figures) {
  constexpr char kDocument[] = "100000";
  constexpr char kOften[] = "63z";
  const auto tool = [&](const std::string& action, const std::string& field, const std::string& term) {
    return std::vector<std::string>{QUORELASTIC_TOOL, "-a", action, "-d", index, "-n",
                                    kDocument,        "-f", field,  "-t", term};
  };
  const auto peer = [&](const std::string& field) {
    return std::vector<std::string>{QUORELASTIC_PEER_LIBRARY_LOOKUP, index, kDocument, field};
  };
  std::vector<std::string> positions = peer("body");
  positions.emplace_back(kOften);
  figures.AddRatio("position of a frequent word in the same index, against the index library without a check",
                   Compare(tool("position", "body", kOften), positions, kLookups), 1.1);
  figures.AddRatio("doc_term in the same index, against the index library without a check",
                   Compare(tool("doc_term", "title", ""), peer("title"), kLookups), 1.1);
}

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
  MeasureLookups(index, figures);
  return figures.all_met();
}

}  // namespace

int main() { return quorelastic::bench::RunBenchmark(Measure); }
