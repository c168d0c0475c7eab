// Sends one request to a daemon, and prints the first reply.
//
//   cmake -B build && cmake --build build
//   g++ -std=c++20 ask.cpp -o ask $(pkg-config --cflags --libs quordaemon)
//   ask /run/quorelasticd.sock '{"command":"status"}'

#include <quordaemon/domain_sock_connection.h>

#include <iostream>
#include <string>

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: ask SOCKET REQUEST" << std::endl;
    return 2;
  }
  quordaemon::DomainSockConnection connection(argv[1]);
  if (!connection.Connect()) {
    std::cerr << "ask: nobody listens on " << argv[1] << std::endl;
    return 1;
  }
  std::string reply;
  if (!connection.Send(argv[2]) || !connection.Recv(reply)) {
    std::cerr << "ask: the connection broke" << std::endl;
    return 1;
  }
  std::cout << reply << std::endl;
  return 0;
}
