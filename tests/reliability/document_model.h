#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace quorelastic::testing {

// What may be found in an index whose daemon was killed while several clients wrote to it.
//
// For each id it keeps the versions that were written, a deletion being version 0. Each carries two readings of
// one clock, which ticks with every event: when the request was sent, and when its final reply was there. A
// version is committed when a commit was acknowledged that was sent after the version's own acknowledgement, or
// that was part of the same request. What is found must have been written, and it must not have been replaced: no
// committed version may have been sent after the found one was acknowledged. Of requests that overlap, either may
// have come last.
//
// For any thread.
class DocumentModel {
 public:
  struct Change {
    std::string id;
    uint64_t version = 0;
  };

  // A request under way.
  struct Request {
    uint64_t sent = 0;
    std::vector<Change> changes;
  };

  // A version that no change has yet.
  uint64_t NewVersion();

  // To be called before a request is sent. One request does not change an id twice.
  Request Begin(std::vector<Change> changes);

  // To be called once its final reply tells success, with what it says about a commit.
  void Acknowledge(const Request& request, bool committed);

  // Whether a commit has been acknowledged after anything was written.
  bool HasCommit() const;

  // Compares with what is there, a version for each id that exists. The result says what should not be so, a line
  // each. From then on, what is there counts as committed.
  std::vector<std::string> Compare(const std::map<std::string, uint64_t>& found);

  // How many versions a commit has been acknowledged for so far, as Compare() saw it.
  size_t committed_versions() const { return committed_versions_; }

 private:
  static constexpr uint64_t kNever = std::numeric_limits<uint64_t>::max();

  struct State {
    uint64_t version = 0;
    uint64_t sent = 0;
    uint64_t acknowledged = kNever;
    bool is_committed = false;  // by its own request
  };

  bool IsCommitted(const State& state) const;
  std::string Judge(const std::string& id, const std::vector<State>& states, uint64_t found) const;

  mutable std::mutex mutex_;
  uint64_t clock_ = 0;
  uint64_t last_version_ = 0;
  uint64_t committed_up_to_ = 0;  // the latest sending of a request whose commit was acknowledged
  std::map<std::string, std::vector<State>> states_;
  size_t committed_versions_ = 0;
};

}  // namespace quorelastic::testing
