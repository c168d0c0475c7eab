// "check" against the index library's own checker on a healthy index, and the lookups that are checked beforehand
// against the library's without; whole processes, as ratios in one run.

#include <cstdint>
#include <string>
#include <vector>

#include "support/figures.h"
#include "support/folder_size.h"
#include "support/run_benchmark.h"
#include "support/timed_run.h"

namespace {

using quorelastic::bench::Compare;
using quorelastic::bench::Comparison;
using quorelastic::bench::Figures;
using quorelastic::bench::FolderSize;
using quorelastic::bench::Run;

constexpr int64_t kMebibyte = 1 << 20;
constexpr int kRuns = 5;
constexpr int kManifestRuns = 15;  // a small difference of large numbers
constexpr int kLookups = 101;
constexpr double kMostMillisecondsPerGigabyte = 100;

std::vector<std::string> OnOne(std::vector<std::string> command) {
  command.insert(command.begin(), {"/usr/bin/taskset", "--cpu-list", "0"});
  return command;
}

std::vector<std::string> Check(const std::string& index) {
  return {QUORELASTIC_TOOL, "-a", "check", "-d", index};
}

void MeasureChecks(Figures& figures, const std::string& index) {
  const std::vector<std::string> peer = {QUORELASTIC_PEER_LIBRARY_CHECK, index};
  figures.AddRatio("check of an index of 320 MiB on one processor, against the index library's checker",
                   Compare(OnOne(Check(index)), peer, kRuns), 0.06);
  const Comparison all = Compare(Check(index), peer, kRuns);
  figures.AddRatio("the same on all processors", all, 0.035);
  figures.AddPeak("peak memory of check", all.ours.peak_bytes, 64 * kMebibyte);
}

// Every word of a large text, with its positions and offsets once more in the vectors, and the text itself.
void MeasureText(Figures& figures, const std::string& folder) {
  const std::string index = folder + "/text";
  Run({QUORELASTIC_MAKE_DICTIONARY, index, "/usr/share/dictd/gcide", "320"});
  const Comparison check = Compare(OnOne(Check(index)), OnOne({QUORELASTIC_PEER_SUM_FILES, index}), kRuns);
  figures.AddRatio("check of a large text's index on one processor, against adding up its bytes", check, 8);
  figures.AddPeak("peak memory of this check", check.ours.peak_bytes, 64 * kMebibyte);
}

void MeasureManifests(Figures& figures, const std::string& index, const std::string& folder) {
  const std::string with = folder + "/with";
  std::filesystem::create_directory(with);
  for (const auto& entry : std::filesystem::directory_iterator(index)) {
    std::filesystem::create_hard_link(entry.path(), std::filesystem::path(with) / entry.path().filename());
  }
  Run({QUORELASTIC_MAKE_MANIFEST, with});
  const double milliseconds = kMostMillisecondsPerGigabyte * static_cast<double>(FolderSize(index)) / 1e9;
  const Comparison check = Compare(OnOne(Check(with)), OnOne(Check(index)), kManifestRuns);
  figures.AddDifference("check with a manifest on one processor, against without", check, milliseconds);
  figures.AddPeak("peak memory of check with a manifest", check.ours.peak_bytes, 64 * kMebibyte);

  const std::string loaded = folder + "/loaded";
  Run({QUORELASTIC_PEER_LIBRARY_LOAD, loaded});
  figures.AddRatio(
      "digests of the WordNet index, against writing it",
      Compare({QUORELASTIC_MAKE_MANIFEST, loaded}, {QUORELASTIC_PEER_LIBRARY_LOAD, loaded}, kRuns), 0.05);
}

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
  Figures figures;
  MeasureChecks(figures, index);
  MeasureManifests(figures, index, folder);
  MeasureLookups(index, figures);
  MeasureText(figures, folder);
  return figures.all_met();
}

}  // namespace

int main() { return quorelastic::bench::RunBenchmark(Measure); }
