#pragma once

#include <boost/asio/any_io_executor.hpp>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>

#include "data_root/data_root.h"
#include "data_root/open_index.h"
#include "vantrel/elastic/index_settings.h"

namespace quorelasticd {

// The indexes of a data root that are open: each is opened when it is first used, and once, and of those that
// nobody uses any more only the last ones stay open. For any thread. Throws RequestError, what the engine throws, and
// std::system_error.
class IndexRegistry {
 public:
  // `slow_executor` runs what takes long. Where more than `most_open` indexes are open, those are closed that have
  // not been used for the longest time, but none that is in use. `root` must outlive the registry.
  IndexRegistry(const DataRoot& root, boost::asio::any_io_executor slow_executor, size_t most_open);
  IndexRegistry(const IndexRegistry&) = delete;
  IndexRegistry& operator=(const IndexRegistry&) = delete;

  const DataRoot& root() const { return root_; }
  const boost::asio::any_io_executor& slow_executor() const { return slow_executor_; }

  // The index of this name. It is not deleted as long as the result is held.
  std::shared_ptr<OpenIndex> Use(const std::string& name);

  // The same to read from, but where it is not open, it is opened for the caller alone: no other is closed for it, and
  // it may be deleted meanwhile.
  std::shared_ptr<vantrel::elastic::Index> Look(const std::string& name);

  // Makes an empty index, durably, and returns its settings as the engine completed them. The name must satisfy
  // IsIndexName().
  vantrel::elastic::IndexSettings Create(const std::string& name,
                                         const vantrel::elastic::IndexSettings& settings);

  // Where an index is, which may be in any state. It may be deleted any time.
  std::string PathOf(const std::string& name) const;

  // Commits an index, closes it, and keeps everybody from it as long as the result is held: they are told that it is
  // being repaired. Where it cannot commit, that is thrown, what was not committed is lost, and nobody is kept from the
  // index: the next call succeeds. Refused (locked) while anybody uses it.
  std::shared_ptr<void> Close(const std::string& name);

  // Removes an index and all its files. Refused (locked) while anybody uses it, or writes to it.
  void Delete(const std::string& name);

  size_t open_count() const;

  // Commits every open index, and merges nothing, as the daemon's end is waited for; false, and log lines, where that
  // failed. To be called when nothing else runs.
  bool CommitAll();

 private:
  enum class Reason { kCreation, kDeletion, kRepair };

  // Keeps a name from everybody else.
  class Reservation;

  struct Entry {
    std::shared_ptr<OpenIndex> index;
    uint64_t last_use;  // the greater the later
  };

  // The one that nobody uses, and nobody has used for the longest time, of those that `may` is true for; the end
  // where there is none.
  std::map<std::string, Entry>::iterator FindIdle(const std::function<bool(const OpenIndex&)>& may);

  // Closes those that are too many, and with the mutex held: else somebody might open one again while its writer is
  // still about to go, and find it locked.
  void CloseIdle();

  // Of the names that are kept, those whose index is not in the folder yet.
  size_t CountBeingCreated() const;

  // For these, the mutex is held.
  void RequireUnreserved(const std::string& name) const;
  std::shared_ptr<OpenIndex> TakeUnused(const std::string& name);

  const DataRoot& root_;
  boost::asio::any_io_executor slow_executor_;
  mutable std::mutex mutex_;
  size_t most_open_;
  std::map<std::string, Entry> open_;
  uint64_t uses_ = 0;
  std::map<std::string, Reason> reserved_;
};

}  // namespace quorelasticd
