#include "quordaemon/domain_sock_connection.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace quordaemon {
namespace {

// Keeps off the numbers of standard streams: where a program was started without one, what it prints there
// would go to the peer.
int OpenSocket() {
  const int sock = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (sock == -1 || sock > STDERR_FILENO) return sock;
  const int moved = fcntl(sock, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
  close(sock);
  return moved;
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
  sock_ = OpenSocket();
  if (sock_ == -1) return false;
  // Sockets of this family do not go on connecting after a signal, as others do: it is begun again.
  while (connect(sock_, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
    if (errno == EINTR) continue;
    Disconnect();
    return false;
  }
  return true;
}

}  // namespace quordaemon
