#include "support/scripted_peer.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <stdexcept>
#include <system_error>
#include <utility>

#include "quordaemon/wire.h"

namespace quorelastic::testing {
namespace {

// Ends a script whose next step cannot be done.
struct ToolIsGone {};

Descriptor Listen(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof(address.sun_path)) {
    throw std::runtime_error("path too long for a socket: " + path);
  }
  path.copy(address.sun_path, path.size());
  Descriptor listening(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
  if (bind(listening.get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address)) != 0 ||
      listen(listening.get(), 16) != 0) {
    throw std::system_error(errno, std::generic_category(), "cannot listen at " + path);
  }
  return listening;
}

// False where the wait was ended by `stop`.
bool WaitFor(int descriptor, short events, int stop) {
  std::array<pollfd, 2> watched{pollfd{descriptor, events, 0}, pollfd{stop, POLLIN, 0}};
  while (poll(watched.data(), watched.size(), -1) < 0) {
    if (errno != EINTR) throw std::system_error(errno, std::generic_category(), "poll");
  }
  return watched[0].revents != 0;
}

ScriptedPeer::Script SendReplies(const std::vector<std::string>& replies) {
  return [replies](PeerConnection& connection) {
    connection.ReceiveRequest();
    for (const std::string& reply : replies) connection.Reply(reply);
  };
}

}  // namespace

std::string Framed(const std::string& payload) {
  const quordaemon::Header header = quordaemon::EncodeHeader(static_cast<uint32_t>(payload.size()));
  return std::string(header.begin(), header.end()) + payload;
}

void PeerConnection::Await(short events) const {
  if (sock_.get() < 0 || !WaitFor(sock_.get(), events, stop_)) throw ToolIsGone();
}

// The bytes received, none at the end of the stream.
size_t PeerConnection::ReceiveSome(size_t most) {
  Await(POLLIN);
  std::array<char, 65536> piece;
  const ssize_t got = recv(sock_.get(), piece.data(), std::min(most, piece.size()), 0);
  if (got <= 0) return 0;
  received_.append(piece.data(), static_cast<size_t>(got));
  return static_cast<size_t>(got);
}

void PeerConnection::ReceiveBytes(size_t count) {
  while (count > 0) {
    const size_t got = ReceiveSome(count);
    if (got == 0) throw ToolIsGone();
    count -= got;
  }
}

void PeerConnection::ReceiveRequest() {
  quordaemon::Header header;
  ReceiveBytes(header.size());
  std::copy(received_.end() - static_cast<ptrdiff_t>(header.size()), received_.end(), header.begin());
  ReceiveBytes(quordaemon::DecodeHeader(header));
}

void PeerConnection::Reply(const std::string& payload) { Write(Framed(payload)); }

void PeerConnection::Write(const std::string& bytes) {
  for (size_t at = 0; at < bytes.size();) {
    Await(POLLOUT);
    const ssize_t sent = send(sock_.get(), bytes.data() + at, bytes.size() - at, MSG_NOSIGNAL | MSG_DONTWAIT);
    if (sent < 0 && errno != EAGAIN) throw ToolIsGone();
    if (sent > 0) at += static_cast<size_t>(sent);
  }
}

void PeerConnection::Trickle(const std::string& bytes) {
  for (const char byte : bytes) {
    Write(std::string(1, byte));
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
}

void PeerConnection::Close() { sock_ = Descriptor(); }

ScriptedPeer::ScriptedPeer(const std::string& path, Script script)
    : path_(path), listening_(Listen(path)), stop_(eventfd(0, EFD_CLOEXEC)) {
  thread_ = std::thread([this, script = std::move(script)] { Serve(script); });
}

ScriptedPeer::ScriptedPeer(const std::string& path, const std::vector<std::string>& replies)
    : ScriptedPeer(path, SendReplies(replies)) {}

ScriptedPeer::~ScriptedPeer() {
  Finish();
  unlink(path_.c_str());
}

bool ScriptedPeer::Accept(Descriptor& accepted) const {
  accepted = Descriptor(accept4(listening_.get(), nullptr, nullptr, SOCK_CLOEXEC));
  return accepted.get() >= 0;
}

void ScriptedPeer::Serve(const Script& script) {
  Descriptor accepted;
  if (!WaitFor(listening_.get(), POLLIN, stop_.get()) || !Accept(accepted)) return;
  connections_ = 1;
  PeerConnection connection(std::move(accepted), stop_.get());
  try {
    script(connection);
    while (connection.ReceiveSome(SIZE_MAX) > 0) continue;
  } catch (const ToolIsGone&) {
    // What was received until then is what the test asks for.
  }
  received_ = std::move(connection.received_);
}

void ScriptedPeer::Finish() {
  if (!thread_.joinable()) return;
  eventfd_write(stop_.get(), 1);
  thread_.join();
  Descriptor another;
  while (Accept(another)) ++connections_;
}

const std::string& ScriptedPeer::Received() {
  Finish();
  return received_;
}

int ScriptedPeer::Connections() {
  Finish();
  return connections_;
}

}  // namespace quorelastic::testing
