#include "document_model.h"

#include <algorithm>
#include <utility>

namespace quorelastic::testing {

uint64_t DocumentModel::NewVersion() {
  const std::lock_guard lock(mutex_);
  return ++last_version_;
}

DocumentModel::Request DocumentModel::Begin(std::vector<Change> changes) {
  const std::lock_guard lock(mutex_);
  Request request{++clock_, std::move(changes)};
  for (const Change& change : request.changes) {
    std::vector<State>& states = states_[change.id];
    if (states.empty()) states.push_back({.acknowledged = 0, .is_committed = true});
    states.push_back({.version = change.version, .sent = request.sent});
  }
  return request;
}

void DocumentModel::Acknowledge(const Request& request, bool committed) {
  const std::lock_guard lock(mutex_);
  const uint64_t now = ++clock_;
  if (committed) committed_up_to_ = std::max(committed_up_to_, request.sent);
  for (const Change& change : request.changes) {
    for (State& state : states_.at(change.id)) {
      if (state.sent != request.sent) continue;
      state.acknowledged = now;
      state.is_committed = committed;
    }
  }
}

bool DocumentModel::IsCommitted(const State& state) const {
  return state.is_committed || state.acknowledged <= committed_up_to_;
}

bool DocumentModel::HasCommit() const {
  const std::lock_guard lock(mutex_);
  return std::any_of(states_.begin(), states_.end(), [&](const auto& entry) {
    return std::any_of(entry.second.begin(), entry.second.end(),
                       [&](const State& state) { return state.sent > 0 && IsCommitted(state); });
  });
}

std::string DocumentModel::Judge(const std::string& id, const std::vector<State>& states,
                                 uint64_t found) const {
  // The one committed version that none of the others can be older than and still be there.
  const State* newest = &states.front();
  for (const State& state : states) {
    if (IsCommitted(state) && state.sent > newest->sent) newest = &state;
  }
  std::string problem = id + ": found version " + std::to_string(found) + ", which nobody wrote";
  for (const State& state : states) {  // a deletion may be there several times
    if (state.version != found) continue;
    if (state.acknowledged >= newest->sent) return "";
    problem = id + ": found version " + std::to_string(found) + ", although version " +
              std::to_string(newest->version) + " was committed after it";
  }
  return problem;
}

std::vector<std::string> DocumentModel::Compare(const std::map<std::string, uint64_t>& found) {
  const std::lock_guard lock(mutex_);
  std::vector<std::string> problems;
  for (const auto& [id, version] : found) {
    if (!states_.contains(id)) problems.push_back(id + ": nobody wrote it");
  }
  for (auto& [id, states] : states_) {
    const auto there = found.find(id);
    const uint64_t version = there == found.end() ? 0 : there->second;
    std::string problem = Judge(id, states, version);
    if (!problem.empty()) problems.push_back(std::move(problem));
    committed_versions_ +=
        static_cast<size_t>(std::count_if(states.begin(), states.end(), [&](const State& state) {
          return state.sent > 0 && IsCommitted(state);
        }));
    states = {{.version = version, .acknowledged = 0, .is_committed = true}};
  }
  return problems;
}

}  // namespace quorelastic::testing
