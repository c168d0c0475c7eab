#pragma once

#include <string>

#include "quordaemon/export.h"
#include "quordaemon/sock_connection.h"

namespace quordaemon {

// A connection to a server that listens on a Unix domain socket.
class QUORDAEMON_EXPORT DomainSockConnection : public SockConnection {
 public:
  // Not connected yet.
  explicit DomainSockConnection(const std::string& path);
  ~DomainSockConnection() override;

  // Connects to the path. False when nobody listens there, when it may not be accessed, and when it is too long
  // for a socket address. What was connected before is closed first.
  bool Connect();

 private:
  std::string path_;
};

}  // namespace quordaemon
