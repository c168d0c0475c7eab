#include <algorithm>
#include <chrono>
#include <optional>
#include <utility>

#include "base/limits.h"
#include "base/text.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "health/health_run.h"
#include "health/repair_worker.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::HealthFinding;
using vantrel::elastic::HealthProgress;
using vantrel::elastic::HealthReport;

// Between two progress replies.
constexpr std::chrono::milliseconds kLongestWait{1000};

constexpr size_t kFindingsPerReply = 50;

void RequireTurn(const Turns::Turn& turn) {
  if (turn.is_taken()) return;
  throw LimitExceeded("health_runs", kMostHealthRuns, "checks and repairs at a time");
}

const char* ToText(HealthReport::Manifest manifest) {
  switch (manifest) {
    case HealthReport::Manifest::kNone:
      return "none";
    case HealthReport::Manifest::kNotUsed:
      return "not_used";
    case HealthReport::Manifest::kCompared:
      return "compared";
  }
  return "";
}

// Reads an index that may be too damaged to be opened, so it is not kept from being deleted meanwhile.
class Check : public RunningCommand {
 public:
  Check(const Daemon& daemon, const Json::Value& data)
      : turn_(daemon.health().turns),
        executor_(daemon.health().executor),
        registry_(daemon.registry()),
        name_(data["id"].asString()) {
    RequireTurn(turn_);
    run_.emplace(registry_.PathOf(name_));
  }

  boost::asio::any_io_executor executor() const override { return executor_; }

  Outcome Step() override {
    if (!report_.has_value()) {
      if (!run_->WaitFor(kLongestWait)) return Progress(ToJson(run_->progress()));
      TakeReport();
    }
    if (told_ == report_->findings.size()) return Result(Summary());
    Json::Value progress(Json::objectValue);
    Json::Value& findings = progress["findings"];
    for (size_t i = 0; i < kFindingsPerReply && told_ < report_->findings.size(); ++i) {
      findings.append(ToJson(report_->findings[told_++]));
    }
    return Progress(std::move(progress));
  }

 private:
  void TakeReport() {
    path_ = registry_.PathOf(name_);  // or it has been deleted, and what was found means nothing
    report_ = run_->TakeReport();
  }

  static Json::Value ToJson(const HealthProgress& progress) {
    Json::Value json(Json::objectValue);
    json["segments"] = static_cast<Json::UInt64>(progress.segments);
    json["segments_opened"] = static_cast<Json::UInt64>(progress.segments_opened);
    json["bytes_read"] = static_cast<Json::UInt64>(progress.bytes_read);
    json["bytes_opened"] = static_cast<Json::UInt64>(progress.bytes_opened);
    return json;
  }

  Json::Value ToJson(const HealthFinding& finding) const {
    Json::Value json(Json::objectValue);
    json["file"] = NameOf(finding.file);
    json["offset"] = static_cast<Json::UInt64>(finding.offset);
    json["expected"] = ToOneLine(finding.expected);
    json["found"] = ToOneLine(finding.found);
    json["grade"] = finding.grade == HealthFinding::Grade::kUnsafe ? "unsafe" : "damaged";
    if (!finding.segment.empty()) json["segment"] = finding.segment;
    return json;
  }

  // As it is called in the index's folder.
  std::string NameOf(const std::string& path) const {
    const std::string folder = path_ + "/";
    return ToOneLine(path.starts_with(folder) ? path.substr(folder.size()) : path);
  }

  Json::Value Summary() const {
    Json::Value result(Json::objectValue);
    result["id"] = name_;
    result["clean"] = report_->clean();
    result["findings"] = static_cast<Json::UInt64>(report_->findings.size());
    Json::Value& coverage = result["coverage"];
    coverage["generation"] = static_cast<Json::Int64>(report_->generation);
    coverage["manifest"] = ToText(report_->manifest);
    coverage["bytes"] = static_cast<Json::UInt64>(run_->progress().bytes_opened);
    coverage["files"] = Json::Value(Json::arrayValue);
    for (const std::string& file : report_->files) coverage["files"].append(NameOf(file));
    return result;
  }

  Turns::Turn turn_;
  boost::asio::any_io_executor executor_;
  IndexRegistry& registry_;
  std::string name_;
  std::string path_;
  std::optional<HealthRun> run_;
  std::optional<HealthReport> report_;
  size_t told_ = 0;  // findings
};

class Repair : public RunningCommand {
 public:
  Repair(const Daemon& daemon, const Json::Value& data)
      : turn_(daemon.health().turns),
        executor_(daemon.health().executor),
        registry_(daemon.registry()),
        name_(data["id"].asString()),
        is_dry_run_(data.get("dry_run", true).asBool()) {
    RequireTurn(turn_);
    registry_.PathOf(name_);
  }

  boost::asio::any_io_executor executor() const override { return executor_; }

  Outcome Step() override {
    if (!worker_.has_value()) {
      if (!is_dry_run_) closed_ = registry_.Close(name_);
      worker_.emplace(registry_.PathOf(name_), is_dry_run_);
    }
    std::optional<Json::Value> report = worker_->WaitFor(kLongestWait);
    if (!report.has_value()) return StillRunning();
    uint64_t documents = 0;
    for (const Json::Value& loss : (*report)["lost"]) documents += loss["documents"].asUInt64();
    (*report)["documents_lost"] = static_cast<Json::UInt64>(documents);
    (*report)["dry_run"] = is_dry_run_;
    (*report)["id"] = name_;
    return Result(std::move(*report));
  }

 private:
  // A client that has gone is noticed when it is told something: a plan ends then, but a repair goes on.
  Outcome StillRunning() {
    const auto elapsed =
        std::chrono::duration_cast<std::chrono::seconds>(std::chrono::steady_clock::now() - start_);
    if (!is_dry_run_ || elapsed == told_) return Nothing();
    told_ = elapsed;
    Json::Value progress(Json::objectValue);
    progress["elapsed_s"] = static_cast<Json::Int64>(elapsed.count());
    return Progress(std::move(progress));
  }

  const std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
  std::chrono::seconds told_{0};
  Turns::Turn turn_;
  boost::asio::any_io_executor executor_;
  IndexRegistry& registry_;
  std::string name_;
  bool is_dry_run_;
  std::shared_ptr<void> closed_;  // before the worker: that ends first
  std::optional<RepairWorker> worker_;
};

}  // namespace

Command CheckCommand() {
  return {"check", "Reads every byte of an index and tells what is wrong with it.",
          Object({{"id", true, Text(), "The index's name."}}), Begin<Check>};
}

Command RepairCommand() {
  return {"repair", "Drops the segments of an index that cannot be read, with their documents.",
          Object({
              {"id", true, Text(), "The index's name."},
              {"dry_run", false, Boolean(), "Whether only to tell what would be lost; true by default."},
          }),
          Begin<Repair>};
}

}  // namespace quorelasticd
