#pragma once

#include <cstdint>
#include <functional>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "quorelasticd/daemon_client.h"

namespace quorelastic::testing {

// One of a crowd: sends random requests of every kind, some of them wrong, several at a time, and checks that each
// gets its own replies, with its own data in them. Its documents in the index "crowd" belong to nobody else.
class CrowdClient {
 public:
  // Connects. `number` tells the clients apart.
  CrowdClient(const std::string& socket, int number, uint32_t seed);

  // Sends so many requests and reads all replies, up to the daemon's hanging up. What goes wrong is kept.
  void Run(int requests);

  const std::string& owner() const { return owner_; }  // what its documents say of themselves
  const std::set<std::string>& documents() const {
    return documents_;
  }  // the ids of those that there must be
  const std::vector<std::string>& problems() const { return problems_; }
  int sent() const { return sent_; }

 private:
  // What a request must be answered with.
  struct Expectation {
    JsonValue request_id;  // null where it cannot be told
    std::string command;   // empty where it is not known
    std::string error;     // the code; empty for a success
    bool only_own_hits = false;
  };

  int Pick(int least, int most);
  void SendRandomRequest();
  void SendChange();
  void SendSearch();
  void SendQuickRequest();
  void SendWrongRequest();
  void SendLoad();
  void SendDelete();
  void Send(JsonValue request, const std::string& error = "", bool only_own_hits = false);
  void SendText(const std::string& text, Expectation expectation);
  void ReadReplies();
  void Check(const Expectation& expectation, const JsonValue& reply);

  DaemonClient client_;
  std::string owner_;
  std::mt19937 random_;
  std::vector<Expectation> awaited_;
  std::set<std::string> documents_;
  std::vector<std::string> problems_;
  int sent_ = 0;
};

}  // namespace quorelastic::testing
