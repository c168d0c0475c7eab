#include "support/timed_run.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <stdexcept>
#include <system_error>

namespace quorelastic::bench {
namespace {

[[noreturn]] void Fail(const std::string& what, int error_number) {
  throw std::runtime_error(what + ": " + std::generic_category().message(error_number));
}

pid_t Start(const std::vector<std::string>& command, int standard_output) {
  std::vector<char*> arguments;
  arguments.reserve(command.size() + 1);
  for (const std::string& word : command) arguments.push_back(const_cast<char*>(word.c_str()));
  arguments.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, standard_output, STDOUT_FILENO);
  pid_t process = 0;
  const int error = posix_spawn(&process, arguments[0], &actions, nullptr, arguments.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  if (error != 0) Fail("cannot start " + command[0], error);
  return process;
}

rusage Finish(pid_t process, const std::string& name) {
  int status = 0;
  rusage usage{};
  if (wait4(process, &status, 0, &usage) != process) Fail("cannot wait for " + name, errno);
  if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
    throw std::runtime_error(name + " ended with wait status " + std::to_string(status));
  }
  return usage;
}

double Seconds(const timeval& time) {
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) * 1e-6;
}

uint64_t Drain(int descriptor) {
  static char buffer[1 << 16];
  uint64_t total = 0;
  for (;;) {
    const ssize_t got = read(descriptor, buffer, sizeof buffer);
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) return total;
    total += static_cast<uint64_t>(got);
  }
}

double Median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

Usage Median(const std::vector<Usage>& runs) {
  std::vector<double> wall;
  std::vector<double> cpu;
  Usage median;
  for (const Usage& run : runs) {
    wall.push_back(run.wall_seconds);
    cpu.push_back(run.cpu_seconds);
    median.peak_bytes = std::max(median.peak_bytes, run.peak_bytes);
    median.output_bytes = run.output_bytes;
  }
  median.wall_seconds = Median(wall);
  median.cpu_seconds = Median(cpu);
  return median;
}

}  // namespace

pid_t Start(const std::vector<std::string>& command) { return Start(command, STDOUT_FILENO); }

Usage Run(const std::vector<std::string>& command) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) Fail("cannot make a pipe", errno);
  const auto start = std::chrono::steady_clock::now();
  const pid_t process = Start(command, ends[1]);
  close(ends[1]);
  Usage result;
  result.output_bytes = Drain(ends[0]);
  close(ends[0]);
  const rusage usage = Finish(process, command[0]);
  const std::chrono::duration<double> wall = std::chrono::steady_clock::now() - start;
  result.wall_seconds = wall.count();
  result.cpu_seconds = Seconds(usage.ru_utime) + Seconds(usage.ru_stime);
  result.peak_bytes = int64_t{usage.ru_maxrss} * 1024;
  return result;
}

void RunIntoFile(const std::vector<std::string>& command, const std::string& path) {
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
  if (file < 0) Fail("cannot write " + path, errno);
  const pid_t process = Start(command, file);
  close(file);
  Finish(process, command[0]);
}

Comparison Compare(const std::vector<std::string>& ours, const std::vector<std::string>& peer, int runs) {
  Run(ours);
  Run(peer);
  std::vector<Usage> our_runs;
  std::vector<Usage> peer_runs;
  std::vector<double> ratios;
  std::vector<double> differences;
  for (int i = 0; i < runs; ++i) {
    our_runs.push_back(Run(ours));
    peer_runs.push_back(Run(peer));
    ratios.push_back(our_runs.back().wall_seconds / peer_runs.back().wall_seconds);
    differences.push_back(our_runs.back().wall_seconds - peer_runs.back().wall_seconds);
  }
  return {Median(our_runs), Median(peer_runs), Median(ratios), Median(differences)};
}

}  // namespace quorelastic::bench
