#pragma once

#include <string>

#include "quordaemon/export.h"

namespace quordaemon {

// One end of a connected stream socket, speaking whole messages (see wire.h). Calls block; none of them throws
// for what the peer does, raises SIGPIPE or is disturbed by a signal. For one thread at a time.
class QUORDAEMON_EXPORT SockConnection {
 public:
  SockConnection() = default;

  // Takes over a connected descriptor, such as one that a server accepted.
  explicit SockConnection(int descriptor) : sock_(descriptor) {}

  SockConnection(const SockConnection&) = delete;
  SockConnection& operator=(const SockConnection&) = delete;

  // Closes the socket, if there is one.
  virtual ~SockConnection();

  // Sends `message` whole; true when the system has taken all of it. False, with nothing sent, for a message
  // longer than kLongestMessage and without a connection; false, with an unknown part sent, when the peer is
  // gone.
  bool Send(const std::string& message);

  // Waits for one whole message and puts it in place of what `message` holds. False when the connection ends,
  // breaks, or announces a message longer than kLongestMessage; `message` is empty then. Memory grows with the
  // bytes that have arrived, not with the length that was announced.
  bool Recv(std::string& message);

  // Closes the socket now rather than at destruction.
  void Disconnect();

 protected:
  int sock_ = -1;  // -1: no socket
};

}  // namespace quordaemon
