#include <algorithm>
#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "base/limits.h"
#include "base/text.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "vantrel/elastic/term_listing.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::TermListing;

constexpr size_t kTermsPerReply = 1000;
constexpr size_t kBytesPerReply = size_t{256} << 10;
constexpr std::chrono::milliseconds kLongestListingStep{50};
constexpr int64_t kDefaultMost = 1000;

// One batch of terms a step, so that a client that reads slowly, or not at all, holds up nobody.
class Terms : public RunningCommand {
 public:
  Terms(const Daemon& daemon, const Json::Value& data)
      : slow_executor_(daemon.registry().slow_executor()),
        open_(daemon.registry().Use(data["id"].asString())),
        most_(data.get("max", Json::Int64{kDefaultMost}).asInt64()) {
    if (data.isMember("field")) request_.field = data["field"].asString();
    request_.prefix = data.get("prefix", "").asString();
    request_.live_only = data.get("live", false).asBool();
    if (request_.field.has_value()) CheckField(*request_.field);
  }

  boost::asio::any_io_executor executor() const override { return slow_executor_; }

  Outcome Step() override {
    if (terms_ == nullptr) terms_ = std::make_unique<TermListing>(open_->index().path(), request_);
    Json::Value batch(Json::arrayValue);
    const bool at_end = Fill(batch);
    if (!batch.empty()) {
      is_over_ = at_end;
      Json::Value progress(Json::objectValue);
      progress["terms"] = std::move(batch);
      return Progress(std::move(progress));
    }
    if (!at_end && !is_over_) return Nothing();
    Json::Value result(Json::objectValue);
    result["count"] = static_cast<Json::Int64>(count_);
    result["more"] = has_more_;
    return Result(std::move(result));
  }

 private:
  void CheckField(const std::string& name) const {
    const auto& fields = open_->index().settings().fields;
    if (std::any_of(fields.begin(), fields.end(), [&](const auto& field) { return field.name == name; }))
      return;
    throw RequestError(ErrorCode::kBadRequest, "data.field: the index has no field " + Quoted(name));
  }

  // True when no more terms are to come.
  bool Fill(Json::Value& batch) {
    if (is_over_) return true;
    const auto start = std::chrono::steady_clock::now();
    size_t bytes = 0;
    while (batch.size() < kTermsPerReply && bytes < kBytesPerReply) {
      if (std::chrono::steady_clock::now() - start > kLongestListingStep) return false;
      switch (terms_->Next()) {
        case TermListing::Move::kEnd:
          return true;
        case TermListing::Move::kPassedOver:
          continue;
        case TermListing::Move::kTerm:
          break;
      }
      if (count_ == most_) {
        has_more_ = true;
        return true;
      }
      ++count_;
      bytes += terms_->text().size();
      Json::Value& term = batch.append(Json::objectValue);
      term["field"] = terms_->field();
      term["text"] = terms_->text();
    }
    return false;
  }

  boost::asio::any_io_executor slow_executor_;
  std::shared_ptr<OpenIndex> open_;
  int64_t most_;
  vantrel::elastic::TermListingRequest request_;
  std::unique_ptr<TermListing> terms_;
  int64_t count_ = 0;
  bool has_more_ = false;
  bool is_over_ = false;
};

}  // namespace

Command TermsCommand() {
  return {"terms", "Streams the terms of an index as of its last commit, by field and text, each once.",
          Object({
              {"id", true, Text(), "The index's name."},
              {"field", false, Text(), "The only field whose terms are wanted; all by default."},
              {"prefix", false, Text(), "What the terms begin with, byte for byte."},
              {"live", false, Boolean(),
               "Whether to leave out the terms that only deleted documents hold; false by default."},
              {"max", false, Integer(0, kMostTerms), "How many terms at most, 1000 by default."},
          }),
          [](const Daemon& daemon, Json::Value&& data) -> std::unique_ptr<RunningCommand> {
            return std::make_unique<Terms>(daemon, data);
          }};
}

}  // namespace quorelasticd
