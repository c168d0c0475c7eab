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
#include "support/page_cache.h"
#include "support/run_benchmark.h"
#include "support/timed_run.h"

namespace {

using quorelastic::bench::Comparison;
using quorelastic::bench::Figures;
using quorelastic::bench::Run;
using quorelastic::testing::CountPages;
using quorelastic::testing::PageCount;
using quorelastic::testing::ThrowOutOfPageCache;

constexpr char kColdMebibytes[] = "320";
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

// An index as searches have it.
void MakeIndex(const std::string& root) {
  std::filesystem::create_directory(root);
  Run({QUORELASTIC_MAKE_DOCUMENTS, root + "/index", kColdMebibytes});
}

// How much of a folder's files the page cache holds.
PageCount CountAllPages(const std::string& root) {
  PageCount all;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(root)) {
    if (!entry.is_regular_file()) continue;
    const PageCount count = CountPages(entry.path().string());
    all.resident += count.resident;
    all.all += count.all;
  }
  return all;
}

// How long a program takes to bring cold files in. That they were cold, and then warm, is seen to.
double ColdSeconds(const std::string& program, const std::string& root) {
  if (!ThrowOutOfPageCache(root)) throw std::runtime_error("cannot cool " + root);
  const double seconds = Run({program, root}).wall_seconds;
  const PageCount warm = CountAllPages(root);
  if (warm.resident < warm.all - warm.all / 100) {
    throw std::runtime_error(program + " left " + std::to_string(warm.all - warm.resident) + " of " +
                             std::to_string(warm.all) + " pages cold");
  }
  return seconds;
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
  MakeIndex(root);

  Figures figures;
  figures.AddRatio("warming up a cold index of 320 MiB, against reading its files in order",
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
