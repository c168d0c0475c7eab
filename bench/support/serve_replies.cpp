// A daemon in appearance: answers each request with the lines of a file, one message a line, until it is killed.

#include <sys/socket.h>
#include <sys/un.h>

#include <cstring>
#include <fstream>
#include <iostream>
#include <string>
#include <string_view>

#include "quordaemon/sock_connection.h"
#include "quordaemon/wire.h"

namespace {

int Listen(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof address.sun_path) return -1;
  std::memcpy(address.sun_path, path.data(), path.size());
  const int sock = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (bind(sock, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) return -1;
  return listen(sock, 8) == 0 ? sock : -1;
}

// In pieces as large as the system takes them, so that this end costs little.
void SendAll(int sock, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t sent = send(sock, bytes.data(), bytes.size(), MSG_NOSIGNAL);
    if (sent <= 0) return;
    bytes.remove_prefix(static_cast<size_t>(sent));
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: serve_replies SOCKET FILE\n";
    return 2;
  }
  std::string stream;
  std::ifstream file(argv[2]);
  for (std::string line; std::getline(file, line);) {
    const auto header = quordaemon::EncodeHeader(static_cast<uint32_t>(line.size()));
    stream.append(header.begin(), header.end()).append(line);
  }
  const int listener = Listen(argv[1]);
  if (listener < 0) {
    std::cerr << "serve_replies: cannot listen on " << argv[1] << std::endl;
    return 1;
  }
  for (;;) {
    const int sock = accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
    quordaemon::SockConnection client(sock);
    std::string request;
    if (client.Recv(request)) SendAll(sock, stream);
  }
}
