#include <chrono>
#include <utility>

#include "base/text.h"
#include "commands/command_table.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "version.h"

namespace quorelasticd {
namespace {

class Status : public RunningCommand {
 public:
  explicit Status(const Daemon& daemon) : daemon_(daemon) {}

  Outcome Step() override {
    const Statistics& statistics = daemon_.statistics();
    const auto uptime = std::chrono::steady_clock::now() - statistics.start;
    Json::Value result(Json::objectValue);
    result["version"] = kVersion;
    result["protocol"] = kProtocolVersion;
    result["data"] = ToOneLine(daemon_.registry().root().path());
    result["uptime_s"] =
        static_cast<Json::Int64>(std::chrono::duration_cast<std::chrono::seconds>(uptime).count());
    result["connections"] = static_cast<Json::UInt64>(statistics.connections);
    result["requests"] = static_cast<Json::UInt64>(statistics.requests);
    result["failed_requests"] = static_cast<Json::UInt64>(statistics.failed_requests);
    result["open_indexes"] = static_cast<Json::UInt64>(daemon_.registry().open_count());
    return Result(std::move(result));
  }

 private:
  const Daemon& daemon_;
};

class PluginList : public RunningCommand {
 public:
  explicit PluginList(const Daemon& daemon) : daemon_(daemon) {}

  Outcome Step() override {
    Json::Value result(Json::objectValue);
    result["plugins"] = Json::arrayValue;
    for (const auto& plugin : daemon_.searching().plugins.List()) {
      Json::Value& described = result["plugins"].append(Json::objectValue);
      described["name"] = plugin->name();
      described["summary"] = plugin->summary();
    }
    return Result(std::move(result));
  }

 private:
  const Daemon& daemon_;
};

Json::Value DescribeMembers(const Shape& shape) {
  Json::Value members(Json::arrayValue);
  for (const Member& member : shape.members) {
    Json::Value& described = members.append(Json::objectValue);
    described["name"] = member.name;
    described["type"] = Describe(member.shape);
    described["required"] = member.is_required;
    described["meaning"] = member.meaning;
    const Shape& inner = member.shape.kind == Shape::Kind::kArray ? member.shape.of.front() : member.shape;
    if (!inner.members.empty()) described["members"] = DescribeMembers(inner);
  }
  return members;
}

Json::Value DescribeCommand(const Command& command) {
  Json::Value described(Json::objectValue);
  described["name"] = command.name;
  described["summary"] = command.summary;
  described["members"] = DescribeMembers(command.data);
  return described;
}

class Help : public RunningCommand {
 public:
  explicit Help(const Json::Value& data) {
    if (!data.isMember("command")) return;
    const std::string name = data["command"].asString();
    only_ = FindCommand(name);
    if (only_ == nullptr) {
      throw RequestError(ErrorCode::kUnknownCommand, "data.command: there is no command " + Quoted(name));
    }
  }

  Outcome Step() override {
    Json::Value result(Json::objectValue);
    result["protocol"] = kProtocolVersion;
    result["commands"] = Json::arrayValue;
    for (const Command& command : CommandTable()) {
      if (only_ == nullptr || only_ == &command) result["commands"].append(DescribeCommand(command));
    }
    return Result(std::move(result));
  }

 private:
  const Command* only_ = nullptr;
};

}  // namespace

Command PluginListCommand() {
  return {"plugin_list", "Describes the search plugins that filters can name.", Object({}),
          [](const Daemon& daemon, Json::Value&&) -> std::unique_ptr<RunningCommand> {
            return std::make_unique<PluginList>(daemon);
          }};
}

Command StatusCommand() {
  return {"status", "Tells how the daemon is doing.", Object({}),
          [](const Daemon& daemon, Json::Value&&) -> std::unique_ptr<RunningCommand> {
            return std::make_unique<Status>(daemon);
          }};
}

Command HelpCommand() {
  return {"help", "Describes the commands and what they take.",
          Object({{"command", false, Text(), "The only command to describe; all by default."}}),
          [](const Daemon&, Json::Value&& data) -> std::unique_ptr<RunningCommand> {
            return std::make_unique<Help>(data);
          }};
}

}  // namespace quorelasticd
