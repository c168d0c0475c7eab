#include "quordaemon/sock_connection.h"

#include <sys/socket.h>
#include <sys/uio.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <span>

#include "quordaemon/wire.h"

namespace quordaemon {
namespace {

// How far a message's buffer runs ahead of the bytes that have arrived.
constexpr size_t kReadPiece = size_t{64} << 10;

// Sends both pieces in one go where the system takes them: a small message is one system call.
bool SendAll(int sock, std::span<const uint8_t> header, std::span<const uint8_t> payload) {
  while (!header.empty() || !payload.empty()) {
    iovec pieces[2] = {{const_cast<uint8_t*>(header.data()), header.size()},
                       {const_cast<uint8_t*>(payload.data()), payload.size()}};
    msghdr message{};
    message.msg_iov = pieces;
    message.msg_iovlen = 2;
    const ssize_t sent = sendmsg(sock, &message, MSG_NOSIGNAL);
    if (sent < 0 && errno == EINTR) continue;
    if (sent < 0) return false;
    const auto taken = static_cast<size_t>(sent);
    const size_t of_header = std::min(taken, header.size());
    header = header.subspan(of_header);
    payload = payload.subspan(taken - of_header);
  }
  return true;
}

// The bytes received, 0 at the end of the stream and on failure.
size_t ReceiveSome(int sock, std::span<uint8_t> out) {
  for (;;) {
    const ssize_t got = recv(sock, out.data(), out.size(), 0);
    if (got >= 0) return static_cast<size_t>(got);
    if (errno != EINTR) return 0;
  }
}

bool ReceiveAll(int sock, std::span<uint8_t> out) {
  while (!out.empty()) {
    const size_t got = ReceiveSome(sock, out);
    if (got == 0) return false;
    out = out.subspan(got);
  }
  return true;
}

bool ReceivePayload(int sock, uint32_t length, std::string& message) {
  size_t arrived = 0;
  while (arrived < length) {
    // Doubling keeps the copying linear; the announced length is believed only as far as bytes came.
    const size_t room = std::min<size_t>(length, std::max(arrived * 2, kReadPiece));
    if (message.size() < room) message.resize(room);
    const std::span<uint8_t> buffer(reinterpret_cast<uint8_t*>(message.data()), message.size());
    const size_t got = ReceiveSome(sock, buffer.subspan(arrived));
    if (got == 0) return false;
    arrived += got;
  }
  return true;
}

}  // namespace

SockConnection::~SockConnection() { Disconnect(); }

void SockConnection::Disconnect() {
  if (sock_ != -1) close(sock_);
  sock_ = -1;
}

bool SockConnection::Send(const std::string& message) {
  if (sock_ == -1 || message.size() > kLongestMessage) return false;
  const Header header = EncodeHeader(static_cast<uint32_t>(message.size()));
  return SendAll(sock_, header, std::span(reinterpret_cast<const uint8_t*>(message.data()), message.size()));
}

bool SockConnection::Recv(std::string& message) {
  message.clear();
  Header header;
  if (sock_ == -1 || !ReceiveAll(sock_, header)) return false;
  const uint32_t length = DecodeHeader(header);
  if (length > kLongestMessage || !ReceivePayload(sock_, length, message)) {
    message.clear();
    return false;
  }
  return true;
}

}  // namespace quordaemon
