#include "daemon_client.h"

#include <stdexcept>

namespace quorelastic::testing {

DaemonClient::DaemonClient(const std::string& socket) : DomainSockConnection(socket) {
  if (!Connect()) throw std::runtime_error("cannot connect to " + socket);
}

JsonValue DaemonClient::Receive() {
  std::string text;
  if (!Recv(text)) throw std::runtime_error("the daemon hung up");
  JsonValue reply;
  if (!reply.fromString(text)) throw std::runtime_error("a reply is no JSON: " + text);
  return reply;
}

JsonValue DaemonClient::ReceiveFinal() {
  for (;;) {
    JsonValue reply = Receive();
    if (reply.isMember("success")) return reply;
  }
}

std::vector<JsonValue> DaemonClient::Exchange(const std::string& request) {
  if (!Send(request)) throw std::runtime_error("cannot send a request");
  std::vector<JsonValue> replies;
  do {
    replies.push_back(Receive());
  } while (!replies.back().isMember("success"));
  return replies;
}

JsonValue DaemonClient::Ask(const std::string& request) { return Exchange(request).back(); }

std::string DaemonClient::AskForError(const std::string& request) {
  const JsonValue reply = Ask(request);
  return reply["success"].asBool() ? "" : reply["error"]["code"].asString();
}

bool DaemonClient::IsHungUp() {
  std::string text;
  return !Recv(text);
}

std::string ManyWords(int count) {
  std::string words;
  for (int i = 0; i < count; ++i) words.append("w").append(std::to_string(i)).append(" ");
  return words;
}

}  // namespace quorelastic::testing
