#include "daemon/send_to_daemon.h"

#include <iostream>

#include "quordaemon/domain_sock_connection.h"
#include "vantrel/elastic/json_value.h"

namespace {

constexpr char kSocketPath[] = "/var/run/quorelasticd.sock";

// Only the member's presence counts. A reply that is JSON, but no object, has no members.
bool EndsExchange(const vantrel::elastic::JsonValue& reply) {
  return reply.isObject() && reply.isMember("success");
}

}  // namespace

void SendToDaemon(const std::string& request) {
  vantrel::elastic::JsonValue reply;
  std::string text;
  quordaemon::DomainSockConnection connection(kSocketPath);
  if (!connection.Connect()) {
    std::cerr << "Connect to daemon fail" << std::endl;
    return;
  }
  if (!connection.Send(request)) {
    std::cerr << "Send to daemon fail" << std::endl;
    return;
  }
  do {
    if (!connection.Recv(text)) {
      std::cerr << "Recv from daemon fail" << std::endl;
      return;
    }
    if (!reply.fromString(text)) std::cerr << "Malformed data: " << text << std::endl;
    std::cout << text << std::endl;
  } while (!EndsExchange(reply));
}
