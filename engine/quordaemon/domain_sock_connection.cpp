#include "quordaemon/domain_sock_connection.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <cerrno>
#include <cstring>

namespace quordaemon {
namespace {

// An interrupted connect goes on in the background: it is waited for, not begun again.
bool WaitUntilConnected(int sock) {
  pollfd entry{sock, POLLOUT, 0};
  while (poll(&entry, 1, -1) < 0) {
    if (errno != EINTR) return false;
  }
  int error = 0;
  socklen_t size = sizeof error;
  return getsockopt(sock, SOL_SOCKET, SO_ERROR, &error, &size) == 0 && error == 0;
}

}  // namespace

DomainSockConnection::DomainSockConnection(const std::string& path) : path_(path) {}

DomainSockConnection::~DomainSockConnection() = default;

bool DomainSockConnection::Connect() {
  Disconnect();
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path_.empty() || path_.size() >= sizeof address.sun_path) return false;
  std::memcpy(address.sun_path, path_.data(), path_.size());
  sock_ = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (sock_ == -1) return false;
  if (connect(sock_, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0) return true;
  if (errno == EINTR && WaitUntilConnected(sock_)) return true;
  Disconnect();
  return false;
}

}  // namespace quordaemon
