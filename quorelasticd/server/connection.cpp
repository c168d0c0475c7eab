#include "server/connection.h"

#include <spdlog/spdlog.h>

#include <algorithm>
#include <array>
#include <boost/asio/buffer.hpp>
#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/read.hpp>
#include <boost/asio/write.hpp>
#include <exception>
#include <utility>

namespace quorelasticd {
namespace {

namespace asio = boost::asio;
using boost::system::error_code;

// How far a request's buffer runs ahead of the bytes that have arrived.
constexpr size_t kReadPiece = size_t{64} << 10;

// Replies whose own memory is worth giving back, beside that of what they were made of.
constexpr size_t kLongReply = size_t{4} << 20;

}  // namespace

Connection::Connection(Socket socket, Service& service, const ConnectionTimeouts& timeouts)
    : socket_(std::move(socket)), service_(service), timeouts_(timeouts), timer_(socket_.get_executor()) {
  socket_.non_blocking(true);  // what can be done at once is, without a detour through the scheduler
}

void Connection::Start() {
  asio::post(socket_.get_executor(), [self = shared_from_this()] { self->ReadHeader(); });
}

void Connection::Refuse(std::string reply) {
  asio::post(socket_.get_executor(), [self = shared_from_this(), reply = std::move(reply)]() mutable {
    self->RefuseRequest(std::move(reply));
  });
}

void Connection::Finish() {
  asio::post(socket_.get_executor(), [self = shared_from_this()] {
    self->finishing_ = true;
    if (self->awaiting_request_ && !self->HasArrived()) self->Close();
  });
}

void Connection::Abort() {
  asio::post(socket_.get_executor(), [self = shared_from_this()] { self->Close(); });
}

void Connection::ReadHeader() {
  // A request that has been sent already is read and refused, rather than hung up on.
  if (finishing_ && !HasArrived()) return Close();
  awaiting_request_ = true;
  ArmTimer(timeouts_.idle);
  const auto missing = [self = shared_from_this(), has_begun = false](error_code error,
                                                                      size_t got) mutable -> size_t {
    if (!error && got > 0 && got < self->header_.size()) {
      if (!std::exchange(has_begun, true)) {
        self->awaiting_request_ = false;
        self->BeginMessage(0);
      }
    }
    return error ? 0 : self->header_.size() - got;
  };
  asio::async_read(socket_, asio::buffer(header_), missing,
                   [self = shared_from_this()](error_code error, size_t) {
                     if (error) return self->Close();
                     self->awaiting_request_ = false;
                     self->request_length_ = quordaemon::DecodeHeader(self->header_);
                     if (self->request_length_ > quordaemon::kLongestMessage) {
                       // What follows cannot be told apart from the next request any more.
                       return self->RefuseRequest(self->service_.RefuseTooLong());
                     }
                     self->BeginMessage(self->request_length_);
                     self->arrived_ = 0;
                     self->request_.clear();
                     self->ReadPayload();
                   });
}

void Connection::ReadPayload() {
  while (arrived_ < request_length_) {
    // The announced length is believed only as far as bytes came; doubling keeps the copying linear.
    const size_t room = std::min<size_t>(request_length_, std::max(arrived_ * 2, kReadPiece));
    if (request_.size() < room) request_.resize(room);
    error_code error;
    arrived_ +=
        socket_.read_some(asio::buffer(request_.data() + arrived_, request_.size() - arrived_), error);
    if (error == asio::error::would_block) return AwaitPayload();
    if (error) return Close();
  }
  DisarmTimer();
  request_.resize(arrived_);
  if (finishing_) return RefuseRequest(service_.RefuseShuttingDown());
  memory_use_.Note(request_.capacity());
  execution_ = service_.Begin(std::exchange(request_, std::string()));
  RunStep();
}

void Connection::AwaitPayload() {
  ArmMessageTimer();
  socket_.async_wait(Socket::wait_read, [self = shared_from_this()](error_code error) {
    error ? self->Close() : self->ReadPayload();
  });
}

void Connection::RunStep() {
  const asio::any_io_executor executor = execution_->executor();
  if (!executor) return AfterStep(execution_->Run());
  // The guard keeps the strand's threads from leaving while nothing but this step is under way.
  asio::post(executor, [self = shared_from_this(), guard = asio::make_work_guard(socket_.get_executor())] {
    Execution::Step step = self->execution_->Run();
    try {
      asio::post(self->socket_.get_executor(),
                 [self, step = std::move(step)]() mutable { self->AfterStep(std::move(step)); });
    } catch (const std::exception& error) {
      // The connection goes with this, its only operation, unless its strand kept the next, and cannot run it.
      spdlog::error("a connection is dropped: {}", error.what());
      error_code ignored;
      self->socket_.shutdown(Socket::shutdown_both, ignored);
    }
  });
}

void Connection::AfterStep(Execution::Step step) {
  if (step.finished || !socket_.is_open()) {
    execution_.reset();
    if (step.reply.has_value()) memory_use_.Note(step.reply->size());
    memory_use_.GiveBack();  // before the reply goes out: its client may take its time to read it
  }
  if (!socket_.is_open()) return;
  if (step.reply.has_value()) return WriteReply(std::move(*step.reply), step.finished);
  RunNextStep();
}

void Connection::RunNextStep() {
  if (execution_->executor()) return RunStep();
  // Posted, so that a long row of steps neither nests nor keeps this thread from others.
  asio::post(socket_.get_executor(), [self = shared_from_this()] { self->RunStep(); });
}

void Connection::WriteReply(std::string reply, bool finished) {
  if (!socket_.is_open()) return;
  reply_ = std::move(reply);
  if (reply_.size() >= kLongReply) memory_use_.Note(reply_.size());
  header_ = quordaemon::EncodeHeader(static_cast<uint32_t>(reply_.size()));
  error_code error;
  written_ = socket_.write_some(std::array{asio::buffer(header_), asio::buffer(reply_)}, error);
  if (error && error != asio::error::would_block) return Close();
  if (written_ == header_.size() + reply_.size()) return AfterReply(finished);
  WriteRest(finished);
}

void Connection::WriteRest(bool finished) {
  BeginMessage(reply_.size());
  const size_t of_header = std::min(written_, header_.size());
  const std::array pieces{asio::buffer(header_) + of_header, asio::buffer(reply_) + (written_ - of_header)};
  asio::async_write(
      socket_, pieces,
      [self = shared_from_this(), last = size_t{0}](const error_code& error,
                                                    size_t written) mutable -> size_t {
        if (error) return 0;
        if (written > last) self->ArmMessageTimer();
        last = written;
        return kReadPiece;
      },
      [self = shared_from_this(), finished](error_code error, size_t) {
        if (error) return self->Close();
        self->AfterReply(finished);
      });
}

void Connection::AfterReply(bool finished) {
  DisarmTimer();
  reply_.clear();
  if (reply_.capacity() > kReadPiece) reply_.shrink_to_fit();
  if (refused_) return Linger();
  if (finished) memory_use_.GiveBack();
  finished ? ReadHeader() : RunNextStep();
}

void Connection::RefuseRequest(std::string reply) {
  finishing_ = true;
  refused_ = true;
  WriteReply(std::move(reply), true);
}

// To close while the client still sends would make its sending fail before it reads the refusal.
void Connection::Linger() {
  error_code ignored;
  socket_.shutdown(Socket::shutdown_send, ignored);
  ArmTimer(timeouts_.lingering);
  request_.resize(kReadPiece);
  DropWhatComes();
}

void Connection::DropWhatComes() {
  socket_.async_read_some(asio::buffer(request_), [self = shared_from_this()](error_code error, size_t) {
    error ? self->Close() : self->DropWhatComes();
  });
}

bool Connection::HasArrived() const {
  error_code error;
  const size_t available = socket_.available(error);
  return !error && available > 0;
}

void Connection::BeginMessage(size_t length) {
  const std::chrono::duration<double> at_slowest(static_cast<double>(length) /
                                                 static_cast<double>(timeouts_.slowest));
  message_end_ =
      Clock::now() + timeouts_.stalled + std::chrono::duration_cast<std::chrono::milliseconds>(at_slowest);
  ArmMessageTimer();
}

void Connection::ArmMessageTimer() {
  ArmTimerUntil(std::min(Clock::now() + timeouts_.stalled, message_end_));
}

void Connection::ArmTimer(std::chrono::milliseconds limit) { ArmTimerUntil(Clock::now() + limit); }

void Connection::ArmTimerUntil(Clock::time_point deadline) {
  deadline_ = deadline;
  if (deadline_ < waiting_until_) WaitForDeadline();
}

void Connection::DisarmTimer() { deadline_ = Clock::time_point::max(); }

void Connection::WaitForDeadline() {
  waiting_until_ = deadline_;
  timer_.expires_at(deadline_);
  timer_.async_wait([weak = weak_from_this()](error_code error) {
    if (error) return;
    const std::shared_ptr<Connection> self = weak.lock();
    if (self == nullptr) return;
    self->waiting_until_ = Clock::time_point::max();
    if (self->deadline_ <= Clock::now()) return self->Close();
    if (self->deadline_ < Clock::time_point::max()) self->WaitForDeadline();
  });
}

void Connection::Close() {
  error_code ignored;
  timer_.cancel();
  socket_.close(ignored);
}

}  // namespace quorelasticd
