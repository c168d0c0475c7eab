#pragma once

#include <atomic>
#include <boost/asio/io_context.hpp>
#include <boost/asio/local/stream_protocol.hpp>
#include <boost/asio/signal_set.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/asio/strand.hpp>
#include <boost/asio/thread_pool.hpp>
#include <cstddef>
#include <memory>
#include <vector>

#include "server/connection.h"
#include "server/service.h"

namespace quorelasticd {

struct ServerLimits {
  size_t threads = 4;  // for quick requests, and as many again for slow ones
  size_t connections = 256;
  ConnectionTimeouts timeouts;
  std::chrono::milliseconds shutdown{std::chrono::seconds(60)};  // then what still runs is cut off
};

// Accepts clients on a listening socket and serves them until it is told to stop.
class Server {
 public:
  // Takes over `listener`, a listening Unix domain socket. `service` must outlive the server.
  Server(int listener, Service& service, const ServerLimits& limits);
  Server(const Server&) = delete;
  Server& operator=(const Server&) = delete;
  ~Server();

  // Serves; returns when Stop() was called, or SIGTERM or SIGINT came, and the last request is done.
  void Run();

  // Takes no more clients and no more requests; what is running is finished. From any thread, more than once.
  void Stop();

  // The clients connected now. From any thread.
  size_t connection_count() const { return connection_count_; }

 private:
  void Accept();
  void Admit(Connection::Socket socket);
  void BeginStop();
  void CancelDeadlineIfIdle();
  std::vector<std::shared_ptr<Connection>> LiveConnections();

  ServerLimits limits_;
  Service& service_;
  boost::asio::io_context io_;
  boost::asio::thread_pool slow_threads_;
  // The acceptor, its list of connections, the signals and the deadline share one strand.
  boost::asio::strand<boost::asio::io_context::executor_type> strand_;
  boost::asio::local::stream_protocol::acceptor acceptor_;
  boost::asio::signal_set signals_;
  boost::asio::steady_timer pause_;     // before accepting again when descriptors have run out
  boost::asio::steady_timer deadline_;  // for the last requests, while stopping
  std::vector<std::weak_ptr<Connection>> connections_;
  std::atomic<size_t> connection_count_{0};
  bool stopping_ = false;
};

}  // namespace quorelasticd
