#include "server/server.h"

#include <spdlog/spdlog.h>

#include <algorithm>
#include <boost/asio/post.hpp>
#include <boost/asio/strand.hpp>
#include <csignal>
#include <exception>
#include <thread>
#include <utility>

namespace quorelasticd {
namespace {

namespace asio = boost::asio;
using boost::system::error_code;

// Clients beyond the limit that are told so at the same time; the rest is hung up on.
constexpr size_t kMostRefusals = 64;

constexpr auto kPauseAfterFailure = std::chrono::milliseconds(100);
constexpr auto kWarningInterval = std::chrono::minutes(1);  // of one failure that goes on

}  // namespace

Server::Server(int listener, Service& service, const ServerLimits& limits,
               std::atomic<size_t>& connection_count)
    : limits_(limits),
      service_(service),
      connection_count_(connection_count),
      io_(static_cast<int>(limits.threads)),
      strand_(asio::make_strand(io_)),
      acceptor_(strand_, asio::local::stream_protocol(), listener),
      signals_(strand_, SIGTERM, SIGINT),
      heart_(strand_),
      pause_(strand_),
      deadline_(strand_) {}

Server::~Server() = default;

void Server::BeatEvery(std::chrono::microseconds interval, std::function<void()> beat) {
  beat_interval_ = interval;
  beat_ = std::move(beat);
}

void Server::Beat() {
  if (!beat_ || stopping_) return;
  beat_();
  heart_.expires_after(beat_interval_);
  heart_.async_wait([this](error_code error) {
    if (!error) Beat();
  });
}

void Server::Run(const std::function<void()>& on_stop) {
  on_stop_ = on_stop;
  signals_.async_wait([this](error_code error, int signal) {
    if (error) return;
    spdlog::info("signal {}: finishing what is running", signal);
    BeginStop();
  });
  BeginAccepting();
  asio::post(strand_, [this] { Beat(); });
  std::vector<std::thread> threads;
  try {
    for (size_t i = 1; i < limits_.threads; ++i) threads.emplace_back([this] { RunThread(); });
  } catch (...) {
    io_.stop();
    Join(threads);
    throw;
  }
  RunThread();
  Join(threads);
}

void Server::Join(std::vector<std::thread>& threads) {
  for (std::thread& thread : threads) thread.join();
  is_over_ = true;
}

// A handler that throws, for want of memory, drops its connection; the others go on.
void Server::RunThread() {
  for (;;) {
    try {
      while (has_stopped_accepting_ && !io_.stopped()) {
        io_.run_for(kPauseAfterFailure);
        if (has_stopped_accepting_.exchange(false)) BeginAccepting();
      }
      io_.run();
      return;
    } catch (const std::exception& error) {
      spdlog::error("a connection is dropped: {}", error.what());
    }
  }
}

void Server::Stop() {
  asio::post(strand_, [this] { BeginStop(); });
}

void Server::BeginAccepting() {
  asio::post(strand_, [this, duty = AcceptDuty(this)]() mutable { Accept(std::move(duty)); });
}

void Server::Accept(AcceptDuty duty) {
  if (stopping_) return;
  acceptor_.async_accept(asio::make_strand(io_),
                         [this, duty = std::move(duty)](error_code error, Connection::Socket socket) mutable {
                           if (stopping_) return;
                           if (error && error != asio::error::connection_aborted) {
                             WarnOfFailure(error);
                             return AcceptLater(std::move(duty));
                           }
                           try {
                             if (!error) Admit(std::move(socket));
                           } catch (const std::exception& failure) {
                             spdlog::error("a client is dropped: {}", failure.what());
                           }
                           Accept(std::move(duty));
                         });
}

// Descriptors or memory have run out: trying again at once would only burn the processor.
void Server::AcceptLater(AcceptDuty duty) {
  pause_.expires_after(kPauseAfterFailure);
  pause_.async_wait([this, duty = std::move(duty)](error_code) mutable { Accept(std::move(duty)); });
}

void Server::WarnOfFailure(error_code error) {
  const auto now = std::chrono::steady_clock::now();
  ++untold_failures_;
  if (now < next_warning_) return;
  spdlog::warn("cannot accept a client: {} (tries: {})", error.message(), untold_failures_);
  untold_failures_ = 0;
  next_warning_ = now + kWarningInterval;
}

void Server::Admit(Connection::Socket socket) {
  // The count goes down when the last owner, a pending operation of the connection, lets go.
  const bool is_full = connection_count_ >= limits_.connections;
  if (is_full && refusal_count_ >= kMostRefusals) return;
  std::atomic<size_t>& count = is_full ? refusal_count_ : connection_count_;
  const auto release = [this, &count](Connection* connection) {
    delete connection;
    --count;
    if (is_over_) return;  // with the server, whose strand may be gone
    try {
      asio::post(strand_, [this] { CancelDeadlineIfIdle(); });
    } catch (const std::exception&) {
      // Nobody waits for longer than the deadline.
    }
  };
  auto admitted = std::make_unique<Connection>(std::move(socket), service_, limits_.timeouts);
  ++count;
  const std::shared_ptr<Connection> connection(admitted.release(), release);
  std::erase_if(connections_, [](const std::weak_ptr<Connection>& gone) { return gone.expired(); });
  connections_.push_back(connection);
  is_full ? connection->Refuse(service_.RefuseTooManyConnections(limits_.connections)) : connection->Start();
}

std::vector<std::shared_ptr<Connection>> Server::LiveConnections() {
  std::vector<std::shared_ptr<Connection>> live;
  for (const std::weak_ptr<Connection>& weak : connections_) {
    if (std::shared_ptr<Connection> connection = weak.lock()) live.push_back(std::move(connection));
  }
  return live;
}

void Server::BeginStop() {
  if (stopping_) return;
  stopping_ = true;
  on_stop_();
  error_code ignored;
  acceptor_.close(ignored);
  signals_.cancel(ignored);
  signals_.clear(ignored);  // a second signal ends the process at once
  pause_.cancel();
  heart_.cancel();
  for (const auto& connection : LiveConnections()) connection->Finish();
  deadline_.expires_after(limits_.shutdown);
  deadline_.async_wait([this](error_code error) {
    if (error) return;
    spdlog::warn("{} clients are not done in time and are cut off", connection_count_.load());
    for (const auto& connection : LiveConnections()) connection->Abort();
  });
  CancelDeadlineIfIdle();
}

void Server::CancelDeadlineIfIdle() {
  if (stopping_ && connection_count_ == 0 && refusal_count_ == 0) deadline_.cancel();
}

}  // namespace quorelasticd
