#include "data_root/index_registry.h"

#include <spdlog/spdlog.h>

#include <algorithm>
#include <atomic>
#include <boost/asio/post.hpp>
#include <boost/asio/strand.hpp>
#include <filesystem>
#include <stdexcept>
#include <system_error>
#include <utility>

#include "base/limits.h"
#include "base/text.h"
#include "data_root/index_name.h"
#include "errors/request_error.h"
#include "vantrel/elastic/write_lock.h"

namespace quorelasticd {
namespace {

RequestError NotFound(const std::string& name) {
  return RequestError(ErrorCode::kIndexNotFound, "there is no index " + Quoted(name));
}

// Whether nobody but the registry holds an index, whose mutex is held. The count is read relaxed: what the last holder
// did before it let go must be seen all the same.
bool IsUnused(const std::shared_ptr<OpenIndex>& index) {
  if (index.use_count() > 1) return false;
#ifdef QUORELASTIC_SANITIZED_THREADS
  std::shared_ptr<OpenIndex>(index).reset();  // it knows no fences, but it follows the count itself
#else
  std::atomic_thread_fence(std::memory_order_acquire);
#endif
  return true;
}

// Commits, on its writing turn, an index that nobody uses, so that it can be closed.
void CommitLater(const std::shared_ptr<OpenIndex>& index) {
  boost::asio::post(index->writing_turn(), [index] {
    if (!index->has_changes()) return;
    try {
      Changes(index).Commit();
    } catch (...) {
      spdlog::error("index {}: cannot commit: {}", index->name(), ToRequestError().reason());
    }
  });
}

}  // namespace

class IndexRegistry::Reservation {
 public:
  // The registry's mutex is held.
  Reservation(IndexRegistry& registry, const std::string& name, Reason reason)
      : registry_(registry), name_(name) {
    registry_.reserved_.emplace(name_, reason);
  }
  Reservation(const Reservation&) = delete;
  Reservation& operator=(const Reservation&) = delete;
  ~Reservation() {
    const std::lock_guard lock(registry_.mutex_);
    registry_.reserved_.erase(name_);
  }

 private:
  IndexRegistry& registry_;
  std::string name_;
};

IndexRegistry::IndexRegistry(const DataRoot& root, boost::asio::any_io_executor slow_executor,
                             size_t most_open)
    : root_(root), slow_executor_(std::move(slow_executor)), most_open_(most_open) {}

std::shared_ptr<OpenIndex> IndexRegistry::Use(const std::string& name) {
  const std::lock_guard lock(mutex_);
  if (const auto found = open_.find(name); found != open_.end()) {
    found->second.last_use = ++uses_;
    return found->second.index;
  }
  RequireUnreserved(name);
  auto index = vantrel::elastic::Index::Open(root_.IndexPath(name));
  const auto open =
      std::make_shared<OpenIndex>(name, std::move(index), boost::asio::make_strand(slow_executor_));
  open_.emplace(name, Entry{open, ++uses_});
  CloseIdle();
  return open;
}

std::shared_ptr<vantrel::elastic::Index> IndexRegistry::Look(const std::string& name) {
  {
    const std::lock_guard lock(mutex_);
    if (const auto found = open_.find(name); found != open_.end()) {
      // The caller counts as one that uses it: who closed it now would leave its writer behind.
      const std::shared_ptr<OpenIndex>& open = found->second.index;
      return {open, &open->index()};
    }
    RequireUnreserved(name);
  }
  return vantrel::elastic::Index::Open(root_.IndexPath(name));
}

// The mutex is held: nobody else can begin to use an index meanwhile.
std::map<std::string, IndexRegistry::Entry>::iterator IndexRegistry::FindIdle(
    const std::function<bool(const OpenIndex&)>& may) {
  auto idle = open_.end();
  for (auto entry = open_.begin(); entry != open_.end(); ++entry) {
    if (!IsUnused(entry->second.index) || !may(*entry->second.index)) continue;
    if (idle == open_.end() || entry->second.last_use < idle->second.last_use) idle = entry;
  }
  return idle;
}

// What is not committed is committed first, and closed when the next index is opened.
void IndexRegistry::CloseIdle() {
  while (open_.size() > most_open_) {
    const auto idle = FindIdle([](const OpenIndex& index) { return !index.is_needed(); });
    if (idle == open_.end()) break;
    open_.erase(idle);
  }
  if (open_.size() <= most_open_) return;
  const auto changed = FindIdle([](const OpenIndex& index) { return index.has_changes(); });
  if (changed != open_.end()) CommitLater(changed->second.index);
}

size_t IndexRegistry::CountBeingCreated() const {
  return static_cast<size_t>(std::count_if(reserved_.begin(), reserved_.end(), [&](const auto& entry) {
    return entry.second == Reason::kCreation && !root_.HasIndex(entry.first);
  }));
}

vantrel::elastic::IndexSettings IndexRegistry::Create(const std::string& name,
                                                      const vantrel::elastic::IndexSettings& settings) {
  if (!IsIndexName(name)) throw std::invalid_argument("no name of an index: " + name);
  std::unique_ptr<Reservation> reservation;
  {
    const std::lock_guard lock(mutex_);
    if (reserved_.contains(name) || root_.HasIndex(name)) {
      throw RequestError(ErrorCode::kIndexExists, "there is an index " + Quoted(name) + " already");
    }
    if (root_.ListIndexes().size() + CountBeingCreated() >= kMostIndexes) {
      throw LimitExceeded("stored_indexes", kMostIndexes, "in the data folder");
    }
    reservation = std::make_unique<Reservation>(*this, name, Reason::kCreation);
  }
  const auto created = vantrel::elastic::Index::Create(root_.ClearHiddenPath(name), settings)->settings();
  root_.ShowIndex(name);
  spdlog::info("index {} created", name);
  return created;
}

void IndexRegistry::RequireUnreserved(const std::string& name) const {
  const auto reserved = reserved_.find(name);
  if (reserved != reserved_.end() && reserved->second == Reason::kRepair) {
    throw RequestError(ErrorCode::kLocked, "index " + Quoted(name) + " is being repaired");
  }
  // A name that none can bear is no path either.
  if (!IsIndexName(name) || reserved != reserved_.end() || !root_.HasIndex(name)) throw NotFound(name);
}

// The index, where it is open, which is then no longer.
std::shared_ptr<OpenIndex> IndexRegistry::TakeUnused(const std::string& name) {
  const auto found = open_.find(name);
  if (found == open_.end()) return nullptr;
  if (!IsUnused(found->second.index)) {
    throw RequestError(ErrorCode::kLocked, "index " + Quoted(name) + " is in use by requests still running");
  }
  std::shared_ptr<OpenIndex> taken = std::move(found->second.index);
  open_.erase(found);
  return taken;
}

std::string IndexRegistry::PathOf(const std::string& name) const {
  if (!IsIndexName(name) || !root_.HasIndex(name)) throw NotFound(name);
  return root_.IndexPath(name);
}

std::shared_ptr<void> IndexRegistry::Close(const std::string& name) {
  std::shared_ptr<Reservation> reservation;
  std::shared_ptr<OpenIndex> closing;
  {
    const std::lock_guard lock(mutex_);
    RequireUnreserved(name);
    closing = TakeUnused(name);
    reservation = std::make_shared<Reservation>(*this, name, Reason::kRepair);
  }
  if (closing != nullptr) Changes(closing).Commit(vantrel::elastic::Index::Merging::kNone);
  return reservation;
}

void IndexRegistry::Delete(const std::string& name) {
  std::unique_ptr<Reservation> reservation;
  std::shared_ptr<OpenIndex> closing;
  {
    const std::lock_guard lock(mutex_);
    RequireUnreserved(name);
    closing = TakeUnused(name);
    reservation = std::make_unique<Reservation>(*this, name, Reason::kDeletion);
  }
  closing.reset();  // which lets go of its write lock
  const vantrel::elastic::WriteLock nobody_else_writes(root_.IndexPath(name));
  const std::string hidden = root_.HideIndex(name);
  spdlog::info("index {} deleted", name);
  std::error_code error;  // the index is gone; files that stay behind are removed at the next start
  std::filesystem::remove_all(hidden, error);
  if (error) spdlog::warn("{}: cannot be removed wholly: {}", hidden, error.message());
}

size_t IndexRegistry::open_count() const {
  const std::lock_guard lock(mutex_);
  return open_.size();
}

bool IndexRegistry::CommitAll() {
  const std::lock_guard lock(mutex_);
  bool is_done = true;
  for (const auto& [name, entry] : open_) {
    try {
      Changes(entry.index).Commit(vantrel::elastic::Index::Merging::kNone);
    } catch (...) {
      is_done = false;
      spdlog::error("index {}: cannot commit: {}", name, ToRequestError().reason());
    }
  }
  return is_done;
}

}  // namespace quorelasticd
