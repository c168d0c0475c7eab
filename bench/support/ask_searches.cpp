// Asks a daemon the same searches from so many clients at once, each client its share.

#include <atomic>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <string>
#include <thread>
#include <vector>

#include "quordaemon/domain_sock_connection.h"
#include "vantrel/elastic/json_value.h"

namespace {

std::string ToRequest(const std::string& query) {
  vantrel::elastic::JsonValue request;
  request["command"] = "search";
  request["data"]["indice"].append("wordnet");
  request["data"]["query_string"]["query"] = query;
  return request.toString();
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4) {
    std::cerr << "usage: ask_searches SOCKET QUERIES CLIENTS\n";
    return 2;
  }
  std::vector<std::string> requests;
  std::ifstream file(argv[2]);
  for (std::string query; std::getline(file, query);) requests.push_back(ToRequest(query));
  std::atomic<size_t> next = 0;
  std::atomic<size_t> found = 0;
  const auto ask = [&] {
    quordaemon::DomainSockConnection connection(argv[1]);
    if (!connection.Connect()) return;
    std::string reply;
    for (size_t i = next++; i < requests.size(); i = next++) {
      if (!connection.Send(requests[i]) || !connection.Recv(reply)) return;
      if (reply.find("\"success\":true") != std::string::npos) ++found;
    }
  };
  std::vector<std::thread> clients;
  const size_t count = std::strtoul(argv[3], nullptr, 10);
  clients.reserve(count);
  for (size_t i = 0; i < count; ++i) clients.emplace_back(ask);
  for (std::thread& client : clients) client.join();
  std::cout << found << " of " << requests.size() << " answered" << std::endl;
  return found == requests.size() && found > 0 ? 0 : 1;
}
