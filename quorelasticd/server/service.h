#pragma once

#include <boost/asio/any_io_executor.hpp>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>

namespace quorelasticd {

// One request under way. It is run step by step, so that a long one can be streamed to a client that reads
// slowly without a thread waiting for it: the next step is run when the last reply has gone out. Steps of one
// execution never run at the same time, but on any thread.
class Execution {
 public:
  struct Step {
    std::optional<std::string> reply;  // one message, at most quordaemon::kLongestMessage bytes
    bool finished = false;             // the reply, there must be one then, is the last
  };

  Execution() = default;
  Execution(const Execution&) = delete;
  Execution& operator=(const Execution&) = delete;
  virtual ~Execution() = default;

  // Where the steps run. Steps that may take long (a write, a merge) name an executor of their own, which keeps
  // them away from the threads that serve quick requests; a strand keeps them in turn with others. Empty for
  // quick steps. Must not throw; asked before each step.
  virtual boost::asio::any_io_executor executor() const = 0;

  // Does a part of the work. Must not throw. An execution that is no longer wanted is destroyed between steps.
  virtual Step Run() = 0;
};

// What a server serves. For any number of threads at once.
class Service {
 public:
  Service() = default;
  Service(const Service&) = delete;
  Service& operator=(const Service&) = delete;
  virtual ~Service() = default;

  // Begins to work on one request, whatever its bytes are. Throws nothing but std::bad_alloc.
  virtual std::unique_ptr<Execution> Begin(std::string request) = 0;

  // The final reply for a request that never gets that far, by what stands in its way.
  virtual std::string RefuseTooLong() = 0;  // longer than quordaemon::kLongestMessage
  virtual std::string RefuseTooManyConnections(size_t most) = 0;
  virtual std::string RefuseShuttingDown() = 0;
};

}  // namespace quorelasticd
