#pragma once

#include <atomic>
#include <boost/asio/io_context.hpp>
#include <boost/asio/local/stream_protocol.hpp>
#include <boost/asio/signal_set.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/asio/strand.hpp>
#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <thread>
#include <vector>

#include "server/connection.h"
#include "server/service.h"

namespace quorelasticd {

struct ServerLimits {
  size_t threads = 4;  // what an Execution's own executor runs on comes on top of these
  size_t connections = 256;
  ConnectionTimeouts timeouts;
  std::chrono::milliseconds shutdown{std::chrono::seconds(60)};  // then what still runs is cut off
};

// Accepts clients on a listening socket and serves them until it is told to stop.
class Server {
 public:
  // Takes over `listener`, a listening Unix domain socket. `service` must outlive the server.
  // `connection_count`, which must outlive it too, is kept at the number of clients connected.
  Server(int listener, Service& service, const ServerLimits& limits, std::atomic<size_t>& connection_count);
  Server(const Server&) = delete;
  Server& operator=(const Server&) = delete;
  ~Server();

  // Calls `beat` every `interval`, as long as Run() serves and takes clients: it tells that the server is alive. To be
  // called before Run(). `beat` must neither throw nor block.
  void BeatEvery(std::chrono::microseconds interval, std::function<void()> beat);

  // Serves; returns when Stop() was called, or SIGTERM or SIGINT came, and the last request is done.
  // `on_stop` is called once, when the stopping begins. It must not throw.
  void Run(const std::function<void()>& on_stop);

  // Takes no more clients and no more requests; what is running is finished. From any thread, more than once.
  void Stop();

 private:
  // Held by whatever is going to accept the next client. Where it is dropped, as handlers are when memory runs out,
  // even before they are called, accepting has to begin anew.
  struct NoteThatItWasDropped {
    void operator()(Server* server) const { server->has_stopped_accepting_ = true; }
  };
  using AcceptDuty = std::unique_ptr<Server, NoteThatItWasDropped>;

  void BeginAccepting();
  void Accept(AcceptDuty duty);
  void AcceptLater(AcceptDuty duty);
  void WarnOfFailure(boost::system::error_code error);
  void Admit(Connection::Socket socket);
  void Beat();
  void BeginStop();
  void CancelDeadlineIfIdle();
  std::vector<std::shared_ptr<Connection>> LiveConnections();
  void RunThread();
  void Join(std::vector<std::thread>& threads);

  ServerLimits limits_;
  Service& service_;
  std::atomic<size_t>& connection_count_;  // of clients served
  std::atomic<size_t> refusal_count_{0};   // of clients told that there are too many
  std::atomic<bool> has_stopped_accepting_{false};
  std::atomic<bool> is_over_{false};  // no thread serves any more
  boost::asio::io_context io_;
  // The acceptor, its list of connections, the signals and the timers share one strand.
  boost::asio::strand<boost::asio::io_context::executor_type> strand_;
  boost::asio::local::stream_protocol::acceptor acceptor_;
  boost::asio::signal_set signals_;
  boost::asio::steady_timer heart_;  // until the next beat
  boost::asio::steady_timer pause_;  // before accepting again when descriptors have run out
  std::chrono::steady_clock::time_point next_warning_{};  // of that
  size_t untold_failures_ = 0;                            // since the last one
  boost::asio::steady_timer deadline_;                    // for the last requests, while stopping
  std::vector<std::weak_ptr<Connection>> connections_;
  std::function<void()> on_stop_;
  std::function<void()> beat_;  // may be empty
  std::chrono::microseconds beat_interval_{0};
  bool stopping_ = false;
};

}  // namespace quorelasticd
