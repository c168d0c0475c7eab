#include <utility>
#include <vector>

#include "base/limits.h"
#include "commands/commands.h"
#include "commands/daemon.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::AnalyzedToken;

class Analyze : public RunningCommand {
 public:
  Analyze(const Daemon& daemon, const Json::Value& data)
      : executor_(daemon.searching().executor),
        open_(daemon.registry().Use(data["id"].asString())),
        field_(data["field"].asString()),
        text_(data["text"].asString()) {}

  boost::asio::any_io_executor executor() const override { return executor_; }

  Outcome Step() override {
    Json::Value result(Json::objectValue);
    result["tokens"] = Json::arrayValue;
    for (const AnalyzedToken& token : open_->index().Analyze(field_, text_)) {
      Json::Value& described = result["tokens"].append(Json::objectValue);
      described["text"] = token.text;
      described["position"] = static_cast<Json::UInt64>(token.position);
      described["start"] = static_cast<Json::UInt64>(token.start);
      described["end"] = static_cast<Json::UInt64>(token.end);
    }
    return Result(std::move(result));
  }

 private:
  boost::asio::any_io_executor executor_;
  std::shared_ptr<OpenIndex> open_;
  std::string field_;
  std::string text_;
};

}  // namespace

Command AnalyzeCommand() {
  return {"analyze", "Shows the terms that a field makes of a text.",
          Object({
              {"id", true, Text(), "The index's name."},
              {"field", true, Text(), "The field."},
              {"text", true, TextUpTo(kLongestAnalyzedText), "A value of it."},
          }),
          [](const Daemon& daemon, Json::Value&& data) -> std::unique_ptr<RunningCommand> {
            return std::make_unique<Analyze>(daemon, data);
          }};
}

}  // namespace quorelasticd
