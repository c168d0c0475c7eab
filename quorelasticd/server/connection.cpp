#include "server/connection.h"

#include <algorithm>
#include <array>
#include <boost/asio/buffer.hpp>
#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/post.hpp>
#include <boost/asio/read.hpp>
#include <boost/asio/write.hpp>
#include <utility>

namespace quorelasticd {
namespace {

namespace asio = boost::asio;
using boost::system::error_code;

// How far a request's buffer runs ahead of the bytes that have arrived.
constexpr size_t kReadPiece = size_t{64} << 10;

}  // namespace

Connection::Connection(Socket socket, Service& service, const ConnectionTimeouts& timeouts)
    : socket_(std::move(socket)), service_(service), timeouts_(timeouts), timer_(socket_.get_executor()) {}

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
  asio::async_read(socket_, asio::buffer(header_), [self = shared_from_this()](error_code error, size_t) {
    if (error) return self->Close();
    self->awaiting_request_ = false;
    self->request_length_ = quordaemon::DecodeHeader(self->header_);
    if (self->request_length_ > quordaemon::kLongestMessage) {
      // What follows cannot be told apart from the next request any more.
      return self->RefuseRequest(self->service_.RefuseTooLong());
    }
    self->arrived_ = 0;
    self->request_.clear();
    self->ReadPayload();
  });
}

void Connection::ReadPayload() {
  if (arrived_ == request_length_) {
    DisarmTimer();
    request_.resize(arrived_);
    if (finishing_) return RefuseRequest(service_.RefuseShuttingDown());
    execution_ = service_.Begin(std::exchange(request_, std::string()));
    return RunStep();
  }
  ArmTimer(timeouts_.stalled);
  // The announced length is believed only as far as bytes came; doubling keeps the copying linear.
  const size_t room = std::min<size_t>(request_length_, std::max(arrived_ * 2, kReadPiece));
  if (request_.size() < room) request_.resize(room);
  socket_.async_read_some(asio::buffer(request_.data() + arrived_, request_.size() - arrived_),
                          [self = shared_from_this()](error_code error, size_t got) {
                            if (error) return self->Close();
                            self->arrived_ += got;
                            self->ReadPayload();
                          });
}

void Connection::RunStep() {
  const asio::any_io_executor executor = execution_->executor();
  if (!executor) return AfterStep(execution_->Run());
  // The guard keeps the strand's threads from leaving while nothing but this step is under way.
  asio::post(executor, [self = shared_from_this(), guard = asio::make_work_guard(socket_.get_executor())] {
    Execution::Step step = self->execution_->Run();
    asio::post(self->socket_.get_executor(),
               [self, step = std::move(step)]() mutable { self->AfterStep(std::move(step)); });
  });
}

void Connection::AfterStep(Execution::Step step) {
  if (step.finished || !socket_.is_open()) execution_.reset();
  if (!socket_.is_open()) return;
  if (step.reply.has_value()) return WriteReply(std::move(*step.reply), step.finished);
  // Posted, so that a long row of silent steps neither nests nor keeps this thread from others.
  asio::post(socket_.get_executor(), [self = shared_from_this()] { self->RunStep(); });
}

void Connection::WriteReply(std::string reply, bool finished) {
  if (!socket_.is_open()) return;
  reply_ = std::move(reply);
  header_ = quordaemon::EncodeHeader(static_cast<uint32_t>(reply_.size()));
  written_ = 0;
  ArmTimer(timeouts_.stalled);
  const std::array<asio::const_buffer, 2> pieces{asio::buffer(header_), asio::buffer(reply_)};
  asio::async_write(
      socket_, pieces,
      [self = shared_from_this()](const error_code& error, size_t written) -> size_t {
        if (error) return 0;
        if (written > self->written_) self->ArmTimer(self->timeouts_.stalled);
        self->written_ = written;
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
  finished ? ReadHeader() : RunStep();
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

void Connection::ArmTimer(std::chrono::milliseconds limit) {
  deadline_ = Clock::now() + limit;
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
