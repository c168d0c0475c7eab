#pragma once

#include <boost/asio/io_context.hpp>
#include <boost/asio/local/stream_protocol.hpp>
#include <boost/asio/steady_timer.hpp>
#include <chrono>
#include <cstddef>
#include <memory>
#include <string>

#include "base/memory_use.h"
#include "quordaemon/wire.h"
#include "server/service.h"

namespace quorelasticd {

struct ConnectionTimeouts {
  // Between two requests.
  std::chrono::milliseconds idle{std::chrono::minutes(5)};
  // Within a message, either way, without progress. And what a message may take as a whole, beside the time that
  // its length takes at the slowest speed: a client that goes on byte by byte must not hold its place for ever.
  std::chrono::milliseconds stalled{std::chrono::seconds(30)};
  size_t slowest = size_t{1} << 20;  // bytes a second
  // For a client that was refused to hang up.
  std::chrono::milliseconds lingering{std::chrono::seconds(2)};
};

// One client: reads a request, runs it, writes its replies, then reads the next. At most one request and one
// reply are held at any time. Lives as long as an operation of its is pending. All its state belongs to the
// strand of its socket.
class Connection : public std::enable_shared_from_this<Connection> {
 public:
  using Socket = boost::asio::local::stream_protocol::socket;

  // `socket` must live on a strand of its own. `service` must outlive the connection.
  Connection(Socket socket, Service& service, const ConnectionTimeouts& timeouts);

  // To be called once; from then on the connection keeps itself alive.
  void Start();

  // Writes one last reply, whatever the client sends, and closes; instead of Start().
  void Refuse(std::string reply);

  // Ends the connection: at once when it waits for a request, else after the last reply of the one under way. A
  // request that has arrived, wholly or in part, but was not begun is refused before.
  // From any thread.
  void Finish();

  // Ends the connection at once, whatever it does; a running step goes on, but its reply is lost. From any
  // thread.
  void Abort();

 private:
  using Clock = std::chrono::steady_clock;

  void ReadHeader();
  void ReadPayload();
  void AwaitPayload();
  void RunStep();
  void RunNextStep();
  void AfterStep(Execution::Step step);
  void WriteReply(std::string reply, bool finished);
  void WriteRest(bool finished);
  void AfterReply(bool finished);
  void RefuseRequest(std::string reply);
  void Linger();
  void DropWhatComes();

  // Whether the client has sent something that is not read yet.
  bool HasArrived() const;

  // A message of this many bytes, or what there is to it yet, begins to come or to go.
  void BeginMessage(size_t length);
  // To be called whenever some of it has come or gone.
  void ArmMessageTimer();

  void ArmTimer(std::chrono::milliseconds limit);
  void ArmTimerUntil(Clock::time_point deadline);
  void DisarmTimer();
  void WaitForDeadline();
  void Close();

  Socket socket_;
  Service& service_;
  ConnectionTimeouts timeouts_;

  // What is under way is given up at the deadline. Deadlines move with every message, but seldom come: the timer is
  // set anew only where it would fire too late, and looks at the deadline when it fires.
  boost::asio::steady_timer timer_;
  Clock::time_point deadline_ = Clock::time_point::max();
  Clock::time_point waiting_until_ = Clock::time_point::max();
  Clock::time_point message_end_;  // when the message under way is given up, whatever comes of it

  MemoryUse memory_use_;  // of what follows
  quordaemon::Header header_{};
  uint32_t request_length_ = 0;
  size_t arrived_ = 0;
  std::string request_;
  std::unique_ptr<Execution> execution_;
  std::string reply_;
  size_t written_ = 0;
  bool awaiting_request_ = false;
  bool finishing_ = false;  // no further request is begun
  bool refused_ = false;    // the reply under way is the last, and was given before all was read
};

}  // namespace quorelasticd
