#include "commands/command_service.h"

#include <spdlog/spdlog.h>

#include <utility>

#include "commands/reply.h"
#include "commands/request.h"
#include "quordaemon/wire.h"

namespace quorelasticd {
namespace {

// What is said when there is no memory to say more.
constexpr const char* kLastResort =
    R"({"success":false,"took_ms":0,"error":{"code":"internal","reason":"out of memory"}})";

// Longer requests take so long to parse that other clients would notice.
constexpr size_t kQuickRequest = size_t{256} << 10;

class CommandExecution : public Execution {
 public:
  CommandExecution(const Daemon& daemon, std::string text) : daemon_(daemon), text_(std::move(text)) {}

  boost::asio::any_io_executor executor() const override {
    if (running_ != nullptr) return running_->executor();
    if (text_.size() > kQuickRequest) return daemon_.registry().slow_executor();
    return {};
  }

  Step Run() override {
    try {
      return running_ == nullptr ? Begin() : Continue();
    } catch (...) {
      return Fail();
    }
  }

 private:
  Step Begin() {
    Request request = ParseRequest(std::exchange(text_, std::string()));
    command_ = request.command;
    replies_.Describe(request.command, std::move(request.request_id));
    if (request.error.has_value()) return Fail(*request.error);
    running_ = command_->begin(daemon_, std::move(request.data));
    // Only now it is known where it runs.
    return running_->executor() ? Step() : Continue();
  }

  Step Continue() {
    Outcome outcome = running_->Step();
    switch (outcome.kind) {
      case Outcome::Kind::kNothing:
        return {};
      case Outcome::Kind::kProgress:
        return {replies_.Progress(std::move(outcome.value)), false};
      case Outcome::Kind::kResult:
        break;
    }
    running_.reset();  // lets go of its index before the client can know
    if (!outcome.failure.has_value()) return {replies_.Result(std::move(outcome.value)), true};
    std::string reply = replies_.Partial(std::move(outcome.value), *outcome.failure);
    Log(*outcome.failure);
    ++daemon_.statistics().failed_requests;
    return {std::move(reply), true};
  }

  // Called within a catch block. What the request held is let go first: where memory has run out, the reply may
  // need some of it.
  Step Fail() {
    running_.reset();
    try {
      return Fail(ToRequestError());
    } catch (...) {
      ++daemon_.statistics().failed_requests;
      return {std::move(last_resort_), true};
    }
  }

  Step Fail(const RequestError& error) {
    running_.reset();
    Log(error);
    std::string reply = replies_.Error(error);
    ++daemon_.statistics().failed_requests;
    return {std::move(reply), true};
  }

  void Log(const RequestError& error) const {
    const bool is_our_fault = error.code() == ErrorCode::kInternal || error.code() == ErrorCode::kIoError ||
                              error.code() == ErrorCode::kCorrupt;
    spdlog::log(is_our_fault ? spdlog::level::err : spdlog::level::debug, "{}: {}: {}",
                command_ == nullptr ? "request" : command_->name.c_str(), ToText(error.code()),
                error.reason());
  }

  const Daemon& daemon_;
  std::string text_;                       // until it has been parsed
  std::string last_resort_ = kLastResort;  // made while there is memory for it
  ReplyWriter replies_;
  const Command* command_ = nullptr;
  std::unique_ptr<RunningCommand> running_;
};

std::string Refusal(const RequestError& error) { return ReplyWriter().Error(error); }

}  // namespace

std::unique_ptr<Execution> CommandService::Begin(std::string request) {
  ++daemon_.statistics().requests;
  return std::make_unique<CommandExecution>(daemon_, std::move(request));
}

std::string CommandService::RefuseTooLong() {
  return Refusal(LimitExceeded("message_bytes", quordaemon::kLongestMessage, "bytes"));
}

std::string CommandService::RefuseTooManyConnections(size_t most) {
  return Refusal(LimitExceeded("connections", static_cast<int64_t>(most), "at a time"));
}

std::string CommandService::RefuseShuttingDown() {
  return Refusal(RequestError(ErrorCode::kShuttingDown, "the daemon is about to end"));
}

}  // namespace quorelasticd
