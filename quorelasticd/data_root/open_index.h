#pragma once

#include <atomic>
#include <boost/asio/any_io_executor.hpp>
#include <cstdint>
#include <memory>
#include <string>

#include "vantrel/elastic/index.h"

namespace quorelasticd {

// An index of the data root that is open. Reading is for any thread. Whatever writes runs on writing_turn(), an
// executor that runs one thing at a time: so the writers of an index take turns, and none of them blocks a thread
// while it waits.
class OpenIndex {
 public:
  OpenIndex(std::string name, std::shared_ptr<vantrel::elastic::Index> index,
            boost::asio::any_io_executor writing_turn);
  OpenIndex(const OpenIndex&) = delete;
  OpenIndex& operator=(const OpenIndex&) = delete;

  const std::string& name() const { return name_; }
  vantrel::elastic::Index& index() const { return *index_; }
  const std::shared_ptr<vantrel::elastic::Index>& shared_index() const { return index_; }
  const boost::asio::any_io_executor& writing_turn() const { return writing_turn_; }

  // Whether changes stand that are not committed. For any thread; settled as long as nobody else holds the index.
  bool has_changes() const { return has_changes_; }

  // Whether something would be forgotten if the index were closed now, and opened again. The same.
  bool is_needed() const { return has_changes_ || has_broken_promise_; }

 private:
  friend class Changes;

  std::string name_;
  std::shared_ptr<vantrel::elastic::Index> index_;
  boost::asio::any_io_executor writing_turn_;

  // Written on the writing turn alone.
  uint64_t failures_ = 0;                        // how often the changes since the last commit were lost
  bool has_promised_ = false;                    // changes stand uncommitted whose request has been answered
  std::atomic<bool> has_broken_promise_{false};  // such changes were lost, and nobody has been told
  std::atomic<bool> has_changes_{false};         // any that are not committed
};

// The changes that one request makes. When the disk fails under one request, the engine drops every change since
// the last commit, also those of others: what they then commit would not be what they wrote. This class notices.
// To be used on the index's writing turn only. Throws what the engine throws, and RequestError.
class Changes {
 public:
  explicit Changes(std::shared_ptr<OpenIndex> open) : open_(std::move(open)) {}

  // Runs `change`, which takes the engine's index.
  template <typename Change>
  auto Apply(Change change) {
    CheckNothingLost();
    open_->has_changes_ = true;
    try {
      return change(*open_->index_);
    } catch (...) {
      NoteFailure();
      throw;
    }
  }

  // Makes what was applied durable, and merges segments where that is due and allowed.
  void Commit(vantrel::elastic::Index::Merging merging = vantrel::elastic::Index::Merging::kAllowed);

  // Leaves what was applied to a later commit.
  void Promise();

  // Throws, once, where changes that a Promise() was given for have been lost.
  void ReportBrokenPromise();

 private:
  void CheckNothingLost();

  // Called within a catch block.
  void NoteFailure();

  std::shared_ptr<OpenIndex> open_;
  uint64_t failures_before_ = 0;
  bool has_begun_ = false;
};

}  // namespace quorelasticd
