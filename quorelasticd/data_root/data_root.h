#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/common/file_lock.h"

namespace quorelasticd {

// The folder that the daemon owns:
//
//   <root>/<index>/      an index: the engine's files
//   <root>/import/       where requests may name files
//   <root>/daemon.lock   held while a daemon runs
//   <root>/.new-<index>  an index that is being made
//   <root>/.old-...      an index that is being removed
//
// An index comes and goes by a rename, so that it is there wholly or not at all, whenever the machine stops; what
// is half made or half removed is swept away when the next daemon starts.
//
// Operations throw std::system_error or IndexIoError, with the path, where the file system refuses. They are for any number of
// threads, but at most one at a time for one index name.
class DataRoot {
 public:
  // Creates the folder where it is missing (mode 0750; its parent must exist), takes its lock and sweeps. Throws
  // std::runtime_error, with a message for the administrator, also where another daemon runs on it.
  explicit DataRoot(const std::string& path);
  DataRoot(const DataRoot&) = delete;
  DataRoot& operator=(const DataRoot&) = delete;

  const std::string& path() const { return path_; }
  const std::string& import_path() const { return import_path_; }

  // The names of the indexes, sorted.
  std::vector<std::string> ListIndexes() const;

  // `name` satisfies IsIndexName(), here and below.
  bool HasIndex(const std::string& name) const;
  std::string IndexPath(const std::string& name) const;

  // Where an index is made before it bears its name. Removes what is there; ShowIndex() gives it the name, durably.
  std::string ClearHiddenPath(const std::string& name) const;
  void ShowIndex(const std::string& name) const;

  // Takes the name off an index, durably; what it was can then be removed from the path returned.
  std::string HideIndex(const std::string& name) const;

 private:
  void Sweep() const;

  std::string path_;
  std::string import_path_;
  std::optional<vantrel::elastic::FileLock> lock_;
};

}  // namespace quorelasticd
