#include "server/listener.h"

#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <systemd/sd-daemon.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <system_error>
#include <utility>

#include "quordaemon/domain_sock_connection.h"

namespace quorelasticd {
namespace {

constexpr int kBacklog = 128;
constexpr mode_t kMode = 0660;

[[noreturn]] void Fail(const std::string& path, const std::string& problem, int error_number) {
  throw std::runtime_error(path + ": " + problem + ": " + std::generic_category().message(error_number));
}

// The descriptor that the service manager passed, -1 for none.
int ActivatedSocket() {
  const int count = sd_listen_fds(1);
  if (count <= 0) return -1;
  if (count > 1 || sd_is_socket_unix(SD_LISTEN_FDS_START, SOCK_STREAM, 1, nullptr, 0) <= 0) {
    throw std::runtime_error("the service manager passed something else than one listening Unix socket");
  }
  return SD_LISTEN_FDS_START;
}

std::string PathOf(int sock) {
  sockaddr_un address{};
  socklen_t length = sizeof address;
  if (getsockname(sock, reinterpret_cast<sockaddr*>(&address), &length) != 0) return "";
  return {address.sun_path, strnlen(address.sun_path, sizeof address.sun_path)};
}

sockaddr_un AddressOf(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.empty() || path.size() >= sizeof address.sun_path) Fail(path, "cannot listen", ENAMETOOLONG);
  std::memcpy(address.sun_path, path.data(), path.size());
  return address;
}

// Removes what a dead server has left. Two that start at once cannot both get here: the data folder is locked
// before.
void RemoveStaleSocket(const std::string& path) {
  struct stat status {};
  if (lstat(path.c_str(), &status) != 0) return;
  if (!S_ISSOCK(status.st_mode)) throw std::runtime_error(path + ": exists, and is no socket");
  if (quordaemon::DomainSockConnection(path).Connect()) {
    throw std::runtime_error(path + ": somebody answers on this socket already");
  }
  if (unlink(path.c_str()) != 0) Fail(path, "cannot remove the socket that was left here", errno);
}

int Bind(const std::string& path) {
  const sockaddr_un address = AddressOf(path);
  RemoveStaleSocket(path);
  const int sock = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (sock == -1) Fail(path, "cannot make a socket", errno);
  // Nobody can connect before listen(), so that the mode is right before it matters.
  if (bind(sock, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
      chmod(path.c_str(), kMode) != 0 || listen(sock, kBacklog) != 0) {
    const int error = errno;
    close(sock);
    Fail(path, "cannot listen", error);
  }
  return sock;
}

}  // namespace

Listener::Listener(const std::string& path) : sock_(ActivatedSocket()) {
  if (sock_ != -1) {
    path_ = PathOf(sock_);
    return;
  }
  sock_ = Bind(path);
  path_ = path;
  is_bound_here_ = true;
  lstat(path.c_str(), &bound_file_);
}

Listener::~Listener() {
  if (sock_ != -1) close(sock_);
  // Another daemon may have taken the place over since this one stopped to listen.
  struct stat status {};
  if (!is_bound_here_ || lstat(path_.c_str(), &status) != 0) return;
  if (status.st_dev == bound_file_.st_dev && status.st_ino == bound_file_.st_ino) unlink(path_.c_str());
}

int Listener::Release() { return std::exchange(sock_, -1); }

}  // namespace quorelasticd
