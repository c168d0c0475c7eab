#pragma once

#include <json/value.h>
#include <sys/types.h>

#include <chrono>
#include <optional>
#include <string>

#include "elastic/common/file_descriptor.h"

namespace quorelasticd {

// A repair under way, or its plan, in a process of its own: the index library's checker may crash on a damaged index,
// and trying it out takes forks, which a process with threads cannot afford. The process is this program again. For
// one thread at a time.
class RepairWorker {
 public:
  // Throws std::system_error where no process can be started.
  RepairWorker(const std::string& index_path, bool is_dry_run);
  RepairWorker(const RepairWorker&) = delete;
  RepairWorker& operator=(const RepairWorker&) = delete;

  // Ends the process where it still runs. Whenever that is, the index is left with the commit that it had, or with
  // the repaired one.
  ~RepairWorker();

  // Waits for the end, but not longer than that. The report, once it has come:
  //   {"generation": N, "clean": B, "lost": [{"segment": S, "documents": N, "condemned": B}, ...]}
  // Throws RequestError where the repair failed.
  std::optional<Json::Value> WaitFor(std::chrono::milliseconds most);

 private:
  bool ReadSome(std::chrono::milliseconds most);
  int WaitForExit();

  vantrel::elastic::FileDescriptor output_;
  std::string text_;
  pid_t process_ = -1;
};

// The other end: this program's main where it was started as such a process; nothing where it was not.
std::optional<int> RunAsRepairWorker(int argc, const char* const* argv);

}  // namespace quorelasticd
