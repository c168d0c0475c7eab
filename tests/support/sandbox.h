#pragma once

#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "support/descriptor.h"
#include "support/temporary_folder.h"
#include "support/tool_run.h"

namespace quorelastic::testing {

// A place where the fixed paths of the system belong to one test: a mount namespace made by bubblewrap, for
// root and ordinary users alike. Every program run in one and the same sandbox sees
//
//   /                     the machine's, but read-only
//   folder()              at its own path, writable
//   /run, /var/run        run_folder(): where a daemon's socket stands; the test can listen or connect too
//   /var/lib/quorelastic  data_root()
//   /dev/log              a system log that only this sandbox writes to
//
// and has no privileges: root's programs are refused like anybody's where permissions say so. Process ids are
// the machine's. For one thread.
class Sandbox {
 public:
  // Why no sandbox can be had on this machine, in bubblewrap's own words; empty where it can.
  static const std::string& Refusal();

  Sandbox();
  Sandbox(const Sandbox&) = delete;
  Sandbox& operator=(const Sandbox&) = delete;
  ~Sandbox();

  const std::string& folder() const { return folder_.path(); }
  std::string run_folder() const { return folder_ / "run"; }
  std::string data_root() const { return folder_ / "data"; }

  // Programs that are started from now on see an empty folder at `path`.
  void Hide(const std::string& path) { hidden_.push_back(path); }

  // As the functions of the same names outside. A signal that ends a program is reported as one.
  Process Start(const std::vector<std::string>& command, RunOptions options = {}) const;
  RunResult RunCommand(const std::vector<std::string>& command, RunOptions options = {}) const;
  RunResult RunTool(const std::vector<std::string>& arguments, const RunOptions& options = {}) const;

  // The messages that reached the system log so far, as the C library sent them:
  // "<11>Jan  1 00:00:00 name: text".
  std::vector<std::string> Log();

 private:
  std::vector<std::string> Wrap(const std::vector<std::string>& command) const;
  void CollectLog();
  void DrainLog();

  TemporaryFolder folder_;
  std::vector<std::string> hidden_;
  Descriptor log_socket_;
  Descriptor stop_;
  std::mutex log_mutex_;
  std::vector<std::string> log_;
  std::thread collector_;  // the kernel queues few messages, and then makes the sender wait
};

}  // namespace quorelastic::testing
