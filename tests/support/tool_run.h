#pragma once

#include <sys/resource.h>
#include <sys/types.h>

#include <chrono>
#include <iosfwd>
#include <string>
#include <utility>
#include <vector>

#include "support/descriptor.h"

namespace quorelastic::testing {

struct RunOptions {
  // "NAME=value", added to the test's own environment, which is passed on without its locale settings and
  // POSIXLY_CORRECT.
  std::vector<std::string> environment = {};
  std::string input = {};     // what standard input holds, a file
  int input_descriptor = -1;  // or where standard input is read from instead; stays the caller's
  std::string folder = {};    // the working folder; empty: the test's
  std::vector<std::pair<__rlimit_resource, rlim_t>> limits = {};
  std::chrono::seconds time_limit{60};
  bool record_writes = false;        // see RunResult::writes
  bool status_tells_signal = false;  // an exit status of 128 + n stands for the signal n, as shells have it
};

struct RunResult {
  std::string out;                  // standard output, all of it
  std::string err;                  // standard error
  std::vector<std::string> writes;  // with RunOptions::record_writes: `out`, one entry a write(2)
  int status = -1;                  // the exit status; -1 where a signal ended the run
  int signal = 0;
  pid_t pid = 0;
};

// What a failed expectation shows.
std::ostream& operator<<(std::ostream& stream, const RunResult& result);

// A program that runs beside the test, in a process group of its own. Its output goes to files in memory, so
// that it never waits for the test to read. For one thread, which must live as long as the program does.
class Process {
 public:
  // `command` is the program, looked up in PATH where it has no slash, and its arguments. Where it cannot be
  // run, standard error says why and the status is 127. Throws std::system_error where not even a process
  // can be had.
  explicit Process(const std::vector<std::string>& command, const RunOptions& options = {});
  Process(Process&&) = default;
  ~Process();  // kills the group if need be

  pid_t pid() const { return pid_; }

  // Output so far.
  std::string Out() const;
  std::string Err() const;

  void Signal(int signal) const;  // to the program alone

  // Waits for the end. Past the time limit, counted from here, the group is killed and std::runtime_error is
  // thrown, with what was written until then. To be called once.
  RunResult Wait();

 private:
  void AwaitEnd(RunResult& result);

  std::vector<std::string> command_;
  std::chrono::seconds time_limit_;
  bool status_tells_signal_;
  Descriptor out_;     // memory, or
  Descriptor writes_;  // a socket that keeps each write apart
  Descriptor err_;
  pid_t pid_ = 0;
  Descriptor process_;  // pidfd; closed once the end was seen
};

RunResult RunCommand(const std::vector<std::string>& command, const RunOptions& options = {});

// The path of the real quorelastic of this build.
const std::string& ToolPath();

// Runs it.
RunResult RunTool(const std::vector<std::string>& arguments, const RunOptions& options = {});

}  // namespace quorelastic::testing
