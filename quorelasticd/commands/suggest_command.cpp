#include <algorithm>
#include <limits>
#include <utility>
#include <vector>

#include "base/text.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "commands/used_indexes.h"
#include "vantrel/elastic/search.h"
#include "vantrel/elastic/suggest_terms.h"

namespace quorelasticd {
namespace {

class Suggest : public RunningCommand {
 public:
  Suggest(const Daemon& daemon, const Json::Value& data)
      : executor_(daemon.searching().executor), used_(daemon.registry(), data["indice"]) {
    request_.field = data["field"].asString();
    request_.prefix = data["prefix"].asString();
    request_.skip = data.get("from", Json::UInt64{request_.skip}).asUInt64();
    request_.limit = data.get("size", Json::UInt64{request_.limit}).asUInt64();
    request_.time_limit = daemon.searching().time_limit;
    const size_t most = vantrel::elastic::SearchLimits().window;
    if (request_.skip > most || request_.limit > most - request_.skip) {
      throw LimitExceeded("window", static_cast<int64_t>(most), "suggestions, from and size together");
    }
  }

  boost::asio::any_io_executor executor() const override { return executor_; }

  Outcome Step() override {
    std::vector<std::string> folders;
    for (const auto& open : used_.open()) folders.push_back(open->index().path());
    Json::Value result(Json::objectValue);
    result["suggestions"] = Json::arrayValue;
    for (const auto& suggested : SuggestTerms(folders, request_)) {
      Json::Value& suggestion = result["suggestions"].append(Json::objectValue);
      suggestion["term"] = suggested.term;
      suggestion["doc_freq"] = static_cast<Json::UInt64>(suggested.document_frequency);
    }
    result["warnings"] = Json::arrayValue;
    if (!HasField()) result["warnings"].append("there is no field " + Quoted(request_.field));
    return Result(std::move(result));
  }

 private:
  bool HasField() const {
    return std::any_of(used_.open().begin(), used_.open().end(), [&](const auto& open) {
      const auto& fields = open->index().settings().fields;
      return std::any_of(fields.begin(), fields.end(),
                         [&](const auto& field) { return field.name == request_.field; });
    });
  }

  boost::asio::any_io_executor executor_;
  UsedIndexes used_;
  vantrel::elastic::SuggestRequest request_;
};

}  // namespace

Command SuggestCommand() {
  constexpr int64_t kAnyMost = std::numeric_limits<int64_t>::max();
  return {
      "suggest", "Completes a prefix by the terms of a field, the most frequent first.",
      Object({
          {"indice", true, UsedIndexes::Names(), "The names of the indexes, looked at as if they were one."},
          {"field", true, Text(), "The field."},
          {"prefix", true, Text(), "What the terms begin with, byte for byte."},
          {"from", false, Integer(0, kAnyMost), "How many suggestions to pass over; 0 by default."},
          {"size", false, Integer(0, kAnyMost), "How many to return at most; 10 by default."},
      }),
      [](const Daemon& daemon, Json::Value&& data) -> std::unique_ptr<RunningCommand> {
        return std::make_unique<Suggest>(daemon, data);
      }};
}

}  // namespace quorelasticd
