// Memory occupation and the page-cache warm-up against their peers, as ratios in one run.

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <filesystem>
#include <functional>
#include <iostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "support/figures.h"
#include "support/run_benchmark.h"
#include "support/timed_run.h"

namespace {

using quorelastic::bench::Comparison;
using quorelastic::bench::Figures;
using quorelastic::bench::Run;

constexpr uint64_t kColdBytes = uint64_t{300} << 20;
constexpr char kGibibyte[] = "1024";

double Median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

// The two in turn, each measured by a function of seconds.
Comparison CompareSeconds(const std::function<double()>& ours, const std::function<double()>& peer,
                          int runs) {
  std::vector<double> our_seconds;
  std::vector<double> peer_seconds;
  std::vector<double> ratios;
  ours();
  peer();
  for (int i = 0; i < runs; ++i) {
    our_seconds.push_back(ours());
    peer_seconds.push_back(peer());
    ratios.push_back(our_seconds.back() / peer_seconds.back());
  }
  Comparison comparison;
  comparison.ours.wall_seconds = Median(our_seconds);
  comparison.peer.wall_seconds = Median(peer_seconds);
  comparison.ratio = Median(ratios);
  return comparison;
}

// Copies of one index, as many as it takes.
void MakeIndexes(const std::string& root) {
  std::filesystem::create_directory(root);
  Run({QUORELASTIC_MAKE_TERMS, root + "/0", "600000"});
  uint64_t size = 0;
  for (const auto& entry : std::filesystem::directory_iterator(root + "/0")) size += entry.file_size();
  for (uint64_t copy = 1; copy * size < kColdBytes; ++copy) {
    std::filesystem::copy(root + "/0", root + "/" + std::to_string(copy));
  }
}

// Has the files thrown out of the page cache.
void Cool(const std::string& root) {
  for (const auto& entry : std::filesystem::recursive_directory_iterator(root)) {
    if (!entry.is_regular_file()) continue;
    const int file = open(entry.path().c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0 || fsync(file) != 0 || posix_fadvise(file, 0, 0, POSIX_FADV_DONTNEED) != 0) {
      throw std::runtime_error("cannot cool " + entry.path().string());
    }
    close(file);
  }
}

double ColdSeconds(const std::string& program, const std::string& root) {
  Cool(root);
  return Run({program, root}).wall_seconds;
}

// Reads up to the word that a filling program ends with.
bool AwaitWaiting(int descriptor) {
  std::string text;
  char buffer[256];
  while (text.find("waiting ") == std::string::npos) {
    const ssize_t got = read(descriptor, buffer, sizeof buffer);
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) return false;
    text.append(buffer, static_cast<size_t>(got));
  }
  return true;
}

// From the start of a program that fills memory until it says that it has.
double FillSeconds(const std::vector<std::string>& command) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("cannot make a pipe");
  std::vector<char*> arguments;
  arguments.reserve(command.size() + 1);
  for (const std::string& word : command) arguments.push_back(const_cast<char*>(word.c_str()));
  arguments.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, ends[1], STDERR_FILENO);
  pid_t process = 0;
  const auto start = std::chrono::steady_clock::now();
  const int error = posix_spawn(&process, arguments[0], &actions, nullptr, arguments.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  close(ends[1]);
  if (error != 0) throw std::runtime_error("cannot start " + command[0]);
  const bool filled = AwaitWaiting(ends[0]);
  const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
  kill(process, SIGKILL);
  waitpid(process, nullptr, 0);
  close(ends[0]);
  if (!filled) throw std::runtime_error(command[0] + " did not fill its memory");
  return took.count();
}

bool Measure(const std::string& folder) {
  const std::string root = folder + "/root";
  MakeIndexes(root);

  Figures figures;
  figures.AddRatio("warming up 300 MiB of cold indexes, against reading their files in order",
                   CompareSeconds([&] { return ColdSeconds(QUORELASTIC_WARM_PAGE_CACHE, root); },
                                  [&] { return ColdSeconds(QUORELASTIC_PEER_READ_FILES, root); }, 15),
                   1.0);
  figures.AddRatio("filling 1 GiB, against one memset",
                   CompareSeconds(
                       [] {
                         return FillSeconds({QUORELASTIC_TOOL, "-a", "occupy_mem", "--size", kGibibyte});
                       },
                       [] {
                         return FillSeconds({QUORELASTIC_PEER_FILL_MEMORY, kGibibyte});
                       },
                       15),
                   1.1);
  return figures.all_met();
}

}  // namespace

int main() { return quorelastic::bench::RunBenchmark(Measure); }
