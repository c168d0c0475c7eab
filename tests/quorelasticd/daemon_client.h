#pragma once

#include <string>
#include <vector>

#include "quordaemon/domain_sock_connection.h"
#include "vantrel/elastic/json_value.h"

namespace quorelastic::testing {

using vantrel::elastic::JsonValue;

// A client of a daemon, connected from the start. What goes wrong on the way is thrown as std::runtime_error.
class DaemonClient : public quordaemon::DomainSockConnection {
 public:
  explicit DaemonClient(const std::string& socket);

  int descriptor() const { return sock_; }

  // One reply; it must be JSON.
  JsonValue Receive();

  // The final reply of those to come to one request; what comes before it is dropped.
  JsonValue ReceiveFinal();

  // Sends a request and collects its replies, the final one last.
  std::vector<JsonValue> Exchange(const std::string& request);

  // The final reply to a request.
  JsonValue Ask(const std::string& request);

  // The final reply's "error" "code" to a request; "" where it is a success.
  std::string AskForError(const std::string& request);

  // Whether the daemon hangs up without another word.
  bool IsHungUp();
};

// A text of so many different words.
std::string ManyWords(int count);

}  // namespace quorelastic::testing
