#pragma once

#include <sys/types.h>

#include <cstdint>
#include <memory>
#include <string>

#include "support/temporary_folder.h"
#include "support/tool_run.h"

namespace quorelastic::testing {

// A daemon whose data folder lies on a disk of its own, in memory and of a fixed size, that only it has mounted: in
// a sandbox, which the machine must allow (Sandbox::Refusal()). Its socket is everybody's.
class SmallDiskDaemon {
 public:
  // Starts it, and waits until it serves. Throws std::runtime_error where it does not.
  explicit SmallDiskDaemon(uint64_t disk_bytes);

  std::string socket() const { return folder_ / "socket"; }

  // The disk, as the test can reach it while the daemon runs.
  std::string disk() const;
  std::string data() const { return disk() + "/data"; }

  uint64_t FreeBytes() const;

  // Writes a file into the root of the disk, as large as asked for or as there is room for.
  void WriteBallast(const std::string& name, uint64_t bytes) const;
  void RemoveBallast(const std::string& name) const;

  std::string Log() const { return process_->Err(); }

  // Asks it to end: its exit status.
  int Stop();

 private:
  TemporaryFolder folder_;
  std::unique_ptr<Process> process_;
  pid_t pid_ = 0;
};

}  // namespace quorelastic::testing
