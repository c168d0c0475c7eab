#pragma once

#include <gmock/gmock.h>

#include <string>
#include <utility>
#include <vector>

#include "support/sandbox_test.h"
#include "support/scripted_peer.h"
#include "support/tool_run.h"

namespace quorelastic::testing {

// In bytes, without the length that goes ahead.
inline constexpr size_t kLongestMessage = size_t{64} << 20;

// A run of the tool, and what a daemon saw of it.
struct Exchange {
  RunResult run;
  std::string sent;  // every byte
  int connections = 0;
};

inline std::ostream& operator<<(std::ostream& stream, const Exchange& exchange) {
  return stream << exchange.connections << " connections, " << exchange.sent.size()
                << " bytes sent: " << ::testing::PrintToString(exchange.sent.substr(0, 1000)) << '\n'
                << exchange.run;
}

// An exchange of one connection that carried one request, this one, and whose run went so.
inline auto Sent(const std::string& request, const ::testing::Matcher<RunResult>& run) {
  // Not by Eq(): requests can be too long for a message.
  const auto is_request = [framed = Framed(request)](const std::string& sent) { return sent == framed; };
  return ::testing::AllOf(
      ::testing::Field("connections", &Exchange::connections, 1),
      ::testing::Field("sent", &Exchange::sent, ::testing::ResultOf("is the request", is_request, true)),
      ::testing::Field("run", &Exchange::run, run));
}

// An exchange that did not take place.
inline auto SentNothing(const ::testing::Matcher<RunResult>& run) {
  return ::testing::AllOf(::testing::Field("connections", &Exchange::connections, 0),
                          ::testing::Field("run", &Exchange::run, run));
}

inline constexpr char kDone[] = "{\"success\":true}";

// The base of tests of the actions that talk to the daemon.
class ExchangeTest : public SandboxTest {
 protected:
  std::string SocketPath() const { return sandbox_.run_folder() + "/quorelasticd.sock"; }

  // Runs the tool beside a daemon that follows a script, or sends some replies.
  template <class ScriptOrReplies>
  Exchange Run(const std::vector<std::string>& arguments, const ScriptOrReplies& daemon,
               const RunOptions& options = {}) const {
    ScriptedPeer peer(SocketPath(), daemon);
    Exchange exchange{.run = sandbox_.RunTool(arguments, options), .sent = {}, .connections = 0};
    exchange.sent = peer.Received();
    exchange.connections = peer.Connections();
    return exchange;
  }
  Exchange Run(const std::vector<std::string>& arguments, const RunOptions& options = {}) const {
    return Run(arguments, std::vector<std::string>{kDone}, options);
  }

  Sandbox sandbox_;
};

}  // namespace quorelastic::testing
