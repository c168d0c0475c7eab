#include "data_root/open_index.h"

#include <utility>

#include "errors/request_error.h"
#include "vantrel/elastic/index_error.h"

namespace quorelasticd {

OpenIndex::OpenIndex(std::string name, std::shared_ptr<vantrel::elastic::Index> index,
                     boost::asio::any_io_executor writing_turn)
    : name_(std::move(name)), index_(std::move(index)), writing_turn_(std::move(writing_turn)) {}

void Changes::Commit(vantrel::elastic::Index::Merging merging) {
  Apply([merging](vantrel::elastic::Index& index) {
    try {
      index.Commit(merging);
    } catch (const vantrel::elastic::IndexChangesLostError&) {
      // Noted when it happened, and told to those who lose by it; it is no reason to refuse the changes made since.
      index.Commit(merging);
    }
  });
  open_->has_promised_ = false;
  open_->has_changes_ = false;
}

void Changes::Promise() {
  CheckNothingLost();
  open_->has_promised_ = true;
}

void Changes::ReportBrokenPromise() {
  if (!open_->has_broken_promise_.exchange(false)) return;
  throw RequestError(
      ErrorCode::kIoError,
      "changes that earlier requests made without a commit have been lost by a failure; what was "
      "changed since is committed");
}

void Changes::CheckNothingLost() {
  if (!std::exchange(has_begun_, true)) failures_before_ = open_->failures_;
  if (open_->failures_ == failures_before_) return;
  throw RequestError(
      ErrorCode::kIoError,
      "a failure under another request has undone changes of this one that were not committed yet");
}

void Changes::NoteFailure() {
  try {
    throw;
  } catch (const vantrel::elastic::IndexValueError&) {
    return;  // nothing happened
  } catch (const vantrel::elastic::IndexLockedError&) {
    return;  // nothing could be begun
  } catch (...) {
    ++open_->failures_;
    open_->has_changes_ = false;
    if (std::exchange(open_->has_promised_, false)) open_->has_broken_promise_ = true;
  }
}

}  // namespace quorelasticd
