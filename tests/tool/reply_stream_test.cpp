// The exchange with the daemon: connecting, sending, and the replies up to the one that ends it.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>

#include <chrono>
#include <future>
#include <string>
#include <thread>
#include <vector>

#include "support/files.h"
#include "tool/exchange.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using namespace std::string_literals;
using ::testing::AnyOf;

using Script = ScriptedPeer::Script;
using Replies = std::vector<std::string>;

constexpr char kRequest[] = "{\"command\":\"status\"}";
constexpr char kProgress[] = "{\"progress\":1}";

const std::vector<std::string> kCommand{"-a", "command", "-st", kRequest};

std::string AsLines(const Replies& replies) {
  std::string lines;
  for (const std::string& reply : replies) lines += reply + '\n';
  return lines;
}

class ReplyStreamTest : public ExchangeTest {
 protected:
  Exchange Receive(const Replies& replies) const { return Run(kCommand, replies); }

  // Leaves a socket of some type at the daemon's path, open as long as the result lives.
  Descriptor BindSocket(int type) const {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    SocketPath().copy(address.sun_path, SocketPath().size());
    Descriptor bound(socket(AF_UNIX, type | SOCK_CLOEXEC, 0));
    EXPECT_EQ(bind(bound.get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address)), 0);
    return bound;
  }

  // A request that does not fit into what the system holds between two ends of a socket.
  std::vector<std::string> CommandOfManyBytes() const {
    const std::string path = sandbox_.folder() + "/many";
    WriteFile(path, '"' + std::string(size_t{4} << 20, 'x') + '"');
    return {"-a", "command", "-p", path};
  }
};

class ConnectingTest : public ReplyStreamTest {
 protected:
  RunResult Connect() const { return sandbox_.RunTool(kCommand); }

  static auto Failed() { return Ended(0, "", "Connect to daemon fail\n"); }
};

TEST_F(ConnectingTest, FailsWhereThereIsNoSocket) {
  EXPECT_THAT(Connect(), Failed());
  WriteFile(SocketPath(), "no socket");
  EXPECT_THAT(Connect(), Failed());
}

TEST_F(ConnectingTest, FailsWhereNobodyListens) {
  {
    const Descriptor bound = BindSocket(SOCK_STREAM);
    EXPECT_THAT(Connect(), Failed());
  }
  EXPECT_THAT(Connect(), Failed());
}

TEST_F(ConnectingTest, FailsAtASocketOfAnotherType) {
  const Descriptor bound = BindSocket(SOCK_DGRAM);
  EXPECT_THAT(Connect(), Failed());
}

TEST_F(ConnectingTest, FailsWithoutPermission) {
  ScriptedPeer peer(SocketPath(), {kDone});
  ASSERT_EQ(chmod(SocketPath().c_str(), 0), 0);
  EXPECT_THAT(Connect(), Failed());
  EXPECT_EQ(peer.Connections(), 0);
}

TEST_F(ConnectingTest, FailsForEveryActionThatTalksToTheDaemon) {
  EXPECT_THAT(sandbox_.RunTool({"-a", "search", "-I", "idx", "-q", "text"}), Failed());
  EXPECT_THAT(sandbox_.RunTool({"-a", "dump", "-I", "idx"}), Failed());
}

TEST_F(ReplyStreamTest, EndsWithTheReplyThatHoldsSuccess) {
  EXPECT_THAT(Receive({kDone}), Sent(kRequest, Printed("{\"success\":true}\n")));
}

TEST_F(ReplyStreamTest, EndsWhateverTheValueOfSuccess) {
  for (const char* value : {"false", "null", "0", "\"\"", "[]", "{}", "1e3"}) {
    const std::string reply = "{\"success\":"s + value + ",\"error\":{\"code\":\"bad_request\"}}";
    EXPECT_THAT(Receive({reply}), Sent(kRequest, Printed(reply + '\n')));
  }
}

TEST_F(ReplyStreamTest, KnowsSuccessAlsoWhereItIsNotTheFirstMemberOrIsEscaped) {
  for (const char* reply : {"{\"a\":{\"b\":[1,2]},\"success\":true,\"z\":0}", " { \"success\" : true } ",
                            R"({"\u0073uccess":true})", "{\"success\":1,\"success\":2}"}) {
    EXPECT_THAT(Receive({reply}), Sent(kRequest, Printed(reply + "\n"s)));
  }
}

TEST_F(ReplyStreamTest, PrintsEveryReplyInOrderOnALineOfItsOwn) {
  const Replies replies{"{\"progress\":1}", "{\"progress\":2}", "{\"success\":true,\"n\":3}"};
  EXPECT_THAT(Receive(replies), Sent(kRequest, Printed(AsLines(replies))));
}

TEST_F(ReplyStreamTest, HasNoLimitOnTheNumberOfReplies) {
  Replies replies(20'000, kProgress);
  replies.emplace_back(kDone);
  EXPECT_THAT(Receive(replies), Sent(kRequest, Printed(AsLines(replies))));
}

TEST_F(ReplyStreamTest, GoesOnWhereSuccessIsNoMemberOfTheReplyItself) {
  const Replies replies{"{}",
                        "{\"Success\":true}",
                        "{\"success \":true}",
                        "{\"successful\":true}",
                        R"({"success\u0000":true})",
                        "{\"result\":{\"success\":true}}",
                        "{\"hits\":[{\"success\":true}]}",
                        "{\"a\":\"success\"}",
                        kDone};
  EXPECT_THAT(Receive(replies), Sent(kRequest, Printed(AsLines(replies))));
}

TEST_F(ReplyStreamTest, GoesOnAfterJsonThatIsNoObject) {
  const Replies replies{"[]",
                        "[\"success\"]",
                        "[{\"success\":true}]",
                        "\"success\"",
                        "\"\"",
                        "17",
                        "-0.5",
                        "null",
                        "true",
                        "false",
                        kDone};
  EXPECT_THAT(Receive(replies), Sent(kRequest, Printed(AsLines(replies))));
}

TEST_F(ReplyStreamTest, PrintsAReplyAsItWasReceived) {
  const Replies replies{" {\n\t\"b\" : 1.0 ,\r\n \"a\" : \"\\u00e9\" }\n\n", "{\"bytes\":\"\xff\xfe\"}",
                        "{\"nul\":\"a\0b\"}"s, "{\"success\":\n\"two\nlines\"}\n"};
  EXPECT_THAT(Receive(replies), Sent(kRequest, Printed(AsLines(replies))));
}

TEST_F(ReplyStreamTest, ReportsRepliesThatAreNoJsonAndGoesOn) {
  const Replies malformed{"",
                          " ",
                          "\n",
                          "no json",
                          "success",
                          "{",
                          "{\"success\":true",
                          "{\"success\":true}}",
                          "{\"success\":true,}",
                          "{\"success\":}",
                          "{'success':true}",
                          "{\"success\":true} {\"success\":true}",
                          "{\"success\":true}\0"s,
                          "{\"success\":true}\0 and more"s,
                          "\0{\"success\":true}"s,
                          "two\nlines\n"};
  std::string complaints;
  for (const std::string& reply : malformed) complaints += "Malformed data: " + reply + '\n';
  Replies replies = malformed;
  replies.emplace_back(kDone);
  EXPECT_THAT(Receive(replies), Sent(kRequest, Ended(0, AsLines(replies), complaints)));
}

TEST_F(ReplyStreamTest, ForgetsAReplyBeforeTheNext) {
  const Replies replies{kProgress, "{\"progress\":2", "{\"success\":true,", kProgress, "{\"success\":false}"};
  EXPECT_THAT(Receive(replies),
              Sent(kRequest, Ended(0, AsLines(replies),
                                   "Malformed data: {\"progress\":2\nMalformed data: {\"success\":true,\n")));
}

TEST_F(ReplyStreamTest, ReportsAMalformedReplyBeforeItPrintsIt) {
  ScriptedPeer peer(SocketPath(), {kProgress, "bad", kDone});
  const RunResult run = sandbox_.RunCommand(
      {"sh", "-c", "exec \"$@\" 2>&1", "sh", ToolPath(), "-a", "command", "-st", kRequest});
  EXPECT_THAT(run, Printed("{\"progress\":1}\nMalformed data: bad\nbad\n{\"success\":true}\n"));
}

TEST_F(ReplyStreamTest, TakesAReplyNestedBeyondAllMeasureForMalformed) {
  constexpr size_t kLevels = 100'000;
  const std::string arrays = std::string(kLevels, '[') + std::string(kLevels, ']');
  std::string objects;
  for (size_t i = 0; i < kLevels; ++i) objects += "{\"a\":";
  objects += "1" + std::string(kLevels, '}');
  const Replies replies{arrays, "{\"success\":" + arrays + "}", objects, std::string(kLevels, '['), kDone};
  std::string complaints;
  for (size_t i = 0; i < 4; ++i) complaints += "Malformed data: " + replies[i] + '\n';
  const Exchange exchange = Receive(replies);
  EXPECT_EQ(exchange.run.status, 0);
  EXPECT_TRUE(exchange.run.out == AsLines(replies));
  EXPECT_TRUE(exchange.run.err == complaints);
}

TEST_F(ReplyStreamTest, ReadsAReplyOfAThousandLevels) {
  const std::string reply = "{\"success\":" + std::string(999, '[') + std::string(999, ']') + "}";
  EXPECT_THAT(Receive({reply}), Sent(kRequest, Printed(reply + '\n')));
}

TEST_F(ReplyStreamTest, PrintsTheLongestReply) {
  std::string reply = "{\"success\":true,\"pad\":\"";
  reply += std::string(kLongestMessage - reply.size() - 2, 'x') + "\"}";
  const Exchange exchange = Receive({reply});
  EXPECT_EQ(exchange.run.status, 0);
  EXPECT_EQ(exchange.run.err, "");
  EXPECT_TRUE(exchange.run.out == reply + '\n');
}

TEST_F(ReplyStreamTest, ReportsTheLongestReplyWhereItIsMalformed) {
  const std::string reply(kLongestMessage, '\0');
  const Exchange exchange = Receive({reply, kDone});
  EXPECT_EQ(exchange.run.status, 0);
  EXPECT_TRUE(exchange.run.err == "Malformed data: " + reply + '\n');
  EXPECT_TRUE(exchange.run.out == reply + "\n{\"success\":true}\n");
}

TEST_F(ReplyStreamTest, ReadsRepliesHoweverTheyArrive) {
  const Replies replies{kProgress, "", kDone};
  const auto printed = Ended(0, AsLines(replies), "Malformed data: \n");
  std::string bytes;
  for (const std::string& reply : replies) bytes += Framed(reply);
  const Script trickle = [&](PeerConnection& tool) {
    tool.ReceiveRequest();
    tool.Trickle(bytes);
  };
  EXPECT_THAT(Run(kCommand, trickle), Sent(kRequest, printed));
  const Script all_at_once = [&](PeerConnection& tool) {
    tool.ReceiveRequest();
    tool.Write(bytes);
  };
  EXPECT_THAT(Run(kCommand, all_at_once), Sent(kRequest, printed));
  const Script unasked = [&](PeerConnection& tool) { tool.Write(bytes); };
  EXPECT_THAT(Run(kCommand, unasked), Sent(kRequest, printed));
}

TEST_F(ReplyStreamTest, PrintsNothingThatFollowsTheLastReply) {
  const Script script = [](PeerConnection& tool) {
    tool.ReceiveRequest();
    tool.Write(Framed(kProgress) + Framed(kDone) + Framed("{\"late\":1}") + "\0\0"s);
  };
  EXPECT_THAT(Run(kCommand, script), Sent(kRequest, Printed("{\"progress\":1}\n{\"success\":true}\n")));
}

TEST_F(ReplyStreamTest, ShowsEachReplyAsItArrives) {
  std::promise<void> seen;
  ScriptedPeer peer(SocketPath(), [&](PeerConnection& tool) {
    tool.ReceiveRequest();
    tool.Reply(kProgress);
    seen.get_future().wait();
    tool.Reply(kDone);
  });
  Process run = sandbox_.Start({ToolPath(), "-a", "command", "-st", kRequest});
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  while (run.Out().empty() && std::chrono::steady_clock::now() < deadline) {
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  EXPECT_EQ(run.Out(), "{\"progress\":1}\n");
  seen.set_value();
  EXPECT_THAT(run.Wait(), Printed("{\"progress\":1}\n{\"success\":true}\n"));
}

class BrokenExchangeTest : public ReplyStreamTest {
 protected:
  // The daemon receives the request, sends one reply and these bytes, and closes the connection.
  RunResult CloseAfter(const std::string& bytes) const {
    const Script script = [&](PeerConnection& tool) {
      tool.ReceiveRequest();
      tool.Reply(kProgress);
      tool.Write(bytes);
      tool.Close();
    };
    return Run(kCommand, script).run;
  }
};

constexpr char kSendFailed[] = "Send to daemon fail\n";
constexpr char kReceiveFailed[] = "Recv from daemon fail\n";

TEST_F(BrokenExchangeTest, KeepsTheRepliesThatCameBefore) {
  EXPECT_THAT(CloseAfter(""), Ended(0, "{\"progress\":1}\n", kReceiveFailed));
  EXPECT_THAT(CloseAfter(Framed("bad")),
              Ended(0, "{\"progress\":1}\nbad\n", "Malformed data: bad\nRecv from daemon fail\n"));
}

TEST_F(BrokenExchangeTest, PrintsNothingOfAReplyThatIsCut) {
  const std::string reply = Framed(kDone);
  for (size_t length = 1; length < reply.size(); ++length) {
    EXPECT_THAT(CloseAfter(reply.substr(0, length)), Ended(0, "{\"progress\":1}\n", kReceiveFailed))
        << length;
  }
}

TEST_F(BrokenExchangeTest, EndsAtOnceWhereAReplyIsAnnouncedThatIsTooLong) {
  for (const std::string& header :
       {"\x04\x00\x00\x01"s, "\x7f\xff\xff\xff"s, "\x80\x00\x00\x00"s, "\xff\xff\xff\xff"s}) {
    const Script script = [&](PeerConnection& tool) {  // and stays
      tool.ReceiveRequest();
      tool.Write(header + kDone);
    };
    EXPECT_THAT(Run(kCommand, script), Sent(kRequest, Ended(0, "", kReceiveFailed)));
  }
}

TEST_F(BrokenExchangeTest, OfADaemonThatLeavesUponTheRequest) {
  const Script script = [](PeerConnection& tool) {
    tool.ReceiveRequest();
    tool.Close();
  };
  EXPECT_THAT(Run(kCommand, script), Sent(kRequest, Ended(0, "", kReceiveFailed)));
}

TEST_F(BrokenExchangeTest, OfADaemonThatLeavesBeforeTheRequest) {
  const Script script = [](PeerConnection& tool) { tool.Close(); };
  EXPECT_THAT(Run(CommandOfManyBytes(), script).run, Ended(0, "", kSendFailed));
  // A short request may have left by then.
  EXPECT_THAT(Run(kCommand, script).run, Ended(0, "", AnyOf(kSendFailed, kReceiveFailed)));
}

TEST_F(BrokenExchangeTest, OfADaemonThatLeavesWithinTheRequest) {
  const Script script = [](PeerConnection& tool) {
    tool.Reply(kProgress);
    tool.ReceiveBytes(1000);
    tool.Close();
  };
  const Exchange exchange = Run(CommandOfManyBytes(), script);
  EXPECT_THAT(exchange.run, Ended(0, "", kSendFailed));
  EXPECT_EQ(exchange.connections, 1);
}

TEST_F(BrokenExchangeTest, IsNotBegunAgain) {
  const Script script = [](PeerConnection& tool) { tool.Close(); };
  EXPECT_EQ(Run(kCommand, script).connections, 1);
}

// Runs whose standard streams are not what they should be.
class OddStreamTest : public ReplyStreamTest {
 protected:
  // `redirection` is the shell's.
  Exchange RunWith(const std::string& redirection, const Replies& replies) const {
    ScriptedPeer peer(SocketPath(), replies);
    Exchange exchange;
    exchange.run = sandbox_.RunCommand(
        {"sh", "-c", "exec \"$@\" " + redirection, "sh", ToolPath(), "-a", "command", "-st", kRequest});
    exchange.sent = peer.Received();
    exchange.connections = peer.Connections();
    return exchange;
  }
};

TEST_F(OddStreamTest, DoesNotKeepTheExchangeFromItsEnd) {
  const Replies replies{kProgress, "bad", std::string(100'000, ' '), kDone};
  const std::string complaints = "Malformed data: bad\nMalformed data: " + replies[2] + '\n';
  EXPECT_THAT(RunWith(">/dev/full", replies), Sent(kRequest, Ended(0, "", complaints)));
  EXPECT_THAT(RunWith("2>/dev/full", replies), Sent(kRequest, Printed(AsLines(replies))));
  EXPECT_THAT(RunWith(">/dev/full 2>&1", replies), Sent(kRequest, Printed("")));
}

TEST_F(OddStreamTest, ThatIsClosedDoesNotSendWhatIsPrintedToTheDaemon) {
  const Replies replies{kProgress, "bad", kDone};
  const std::string complaint = "Malformed data: bad\n";
  EXPECT_THAT(RunWith("<&-", replies), Sent(kRequest, Ended(0, AsLines(replies), complaint)));
  EXPECT_THAT(RunWith(">&-", replies), Sent(kRequest, Ended(0, "", complaint)));
  EXPECT_THAT(RunWith("2>&-", replies), Sent(kRequest, Printed(AsLines(replies))));
  EXPECT_THAT(RunWith("<&- >&- 2>&-", replies), Sent(kRequest, Printed("")));
}

TEST_F(OddStreamTest, ThatNobodyReadsAnyMoreEndsTheRun) {
  ScriptedPeer peer(SocketPath(), [](PeerConnection& tool) {
    tool.ReceiveRequest();
    for (;;) tool.Reply(kProgress);
  });
  const RunResult run = sandbox_.RunCommand({"sh", "-c", "env --default-signal=PIPE \"$@\" | head -n 1", "sh",
                                             ToolPath(), "-a", "command", "-st", kRequest});
  EXPECT_THAT(run, Printed("{\"progress\":1}\n"));
}

}  // namespace
}  // namespace quorelastic::testing
