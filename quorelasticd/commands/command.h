#pragma once

#include <json/value.h>

#include <boost/asio/any_io_executor.hpp>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "commands/shape.h"
#include "errors/request_error.h"

namespace quorelasticd {

class Daemon;

// What one step of a command brought.
struct Outcome {
  enum class Kind { kNothing, kProgress, kResult };

  Kind kind = Kind::kNothing;
  Json::Value value;                    // the reply's "progress" or "result"
  std::optional<RequestError> failure;  // a result that is no success: a part was done
};

inline Outcome Nothing() { return {}; }
inline Outcome Progress(Json::Value value) { return {Outcome::Kind::kProgress, std::move(value), {}}; }
inline Outcome Result(Json::Value value) { return {Outcome::Kind::kResult, std::move(value), {}}; }
inline Outcome PartialResult(Json::Value value, RequestError failure) {
  return {Outcome::Kind::kResult, std::move(value), std::move(failure)};
}

// One request of a command under way, see Execution.
class RunningCommand {
 public:
  RunningCommand() = default;
  RunningCommand(const RunningCommand&) = delete;
  RunningCommand& operator=(const RunningCommand&) = delete;
  virtual ~RunningCommand() = default;

  // Where the steps run; empty for quick ones.
  virtual boost::asio::any_io_executor executor() const { return {}; }

  // Does the next part. What it throws ends the request with an error reply.
  virtual Outcome Step() = 0;
};

// One command of the protocol.
struct Command {
  std::string name;
  std::string summary;  // one sentence for people
  Shape data;           // an object; may be missing from a request where none of its members is required

  // Begins one. `data` is of the shape above. Throws like Step().
  std::unique_ptr<RunningCommand> (*begin)(const Daemon& daemon, Json::Value&& data);
};

// Begins a command whose requests are objects of class T.
template <typename T>
std::unique_ptr<RunningCommand> Begin(const Daemon& daemon, Json::Value&& data) {
  return std::make_unique<T>(daemon, std::move(data));
}

}  // namespace quorelasticd
