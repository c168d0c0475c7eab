#include "quordaemon/sock_connection.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <string>
#include <thread>

#include "quordaemon/wire.h"

namespace quordaemon {
namespace {

using namespace std::string_literals;

// A connection and, at its other end, a peer that does to the bytes what a test wants.
class SockConnectionTest : public ::testing::Test {
 protected:
  SockConnectionTest() : SockConnectionTest(Ends()) {}

  ~SockConnectionTest() override { ClosePeer(); }

  void PeerWrites(const std::string& bytes) const {
    ASSERT_EQ(write(peer_, bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
  }

  std::string PeerReads(size_t length) const {
    std::string bytes(length, '\0');
    EXPECT_EQ(recv(peer_, bytes.data(), length, MSG_WAITALL), static_cast<ssize_t>(length));
    return bytes;
  }

  void ClosePeer() {
    if (peer_ != -1) close(peer_);
    peer_ = -1;
  }

  int peer_;
  SockConnection connection_;

 private:
  struct Ends {
    Ends() { EXPECT_EQ(socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, descriptors), 0); }
    int descriptors[2] = {-1, -1};
  };

  explicit SockConnectionTest(const Ends& ends)
      : peer_(ends.descriptors[0]), connection_(ends.descriptors[1]) {}
};

TEST_F(SockConnectionTest, SendsABigEndianLengthAndThePayload) {
  ASSERT_TRUE(connection_.Send("{\"a\":1}"));
  EXPECT_EQ(PeerReads(11), "\0\0\0\7{\"a\":1}"s);
}

TEST_F(SockConnectionTest, SendsAnEmptyMessageAsItsLengthAlone) {
  ASSERT_TRUE(connection_.Send(""));
  EXPECT_EQ(PeerReads(4), "\0\0\0\0"s);
}

TEST_F(SockConnectionTest, SendsNulBytesAsTheyAre) {
  ASSERT_TRUE(connection_.Send("a\0b"s));
  EXPECT_EQ(PeerReads(7), "\0\0\0\3a\0b"s);
}

TEST_F(SockConnectionTest, ReceivesMessagesOneByOneThoughTheyArriveTogether) {
  PeerWrites("\0\0\0\1a\0\0\0\0\0\0\0\2bc"s);
  std::string message = "what was there before";
  ASSERT_TRUE(connection_.Recv(message));
  EXPECT_EQ(message, "a");
  ASSERT_TRUE(connection_.Recv(message));
  EXPECT_EQ(message, "");
  ASSERT_TRUE(connection_.Recv(message));
  EXPECT_EQ(message, "bc");
}

TEST_F(SockConnectionTest, ReceivesAMessageThatTricklesInByteByByte) {
  const std::string wire = "\0\0\0\5hello"s;
  std::thread peer([&] {
    for (const char byte : wire) {
      PeerWrites(std::string(1, byte));
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
  });
  std::string message;
  EXPECT_TRUE(connection_.Recv(message));
  peer.join();
  EXPECT_EQ(message, "hello");
}

TEST_F(SockConnectionTest, CarriesTheLongestMessageBothWays) {
  const std::string longest(kLongestMessage, 'x');
  std::thread peer([&] {
    SockConnection other(dup(peer_));
    std::string message;
    EXPECT_TRUE(other.Recv(message));
    EXPECT_TRUE(other.Send(message));
  });
  ASSERT_TRUE(connection_.Send(longest));
  std::string back;
  EXPECT_TRUE(connection_.Recv(back));
  peer.join();
  EXPECT_TRUE(back == longest);
}

TEST_F(SockConnectionTest, RefusesToSendMoreThanTheLongestAndSendsNothingOfIt) {
  EXPECT_FALSE(connection_.Send(std::string(size_t{kLongestMessage} + 1, 'x')));
  ASSERT_TRUE(connection_.Send("next"));
  EXPECT_EQ(PeerReads(8), "\0\0\0\4next"s);
}

TEST_F(SockConnectionTest, RefusesAnAnnouncedLengthBeyondTheLongest) {
  PeerWrites("\4\0\0\1"s);  // one byte more
  std::string message = "before";
  EXPECT_FALSE(connection_.Recv(message));
  EXPECT_EQ(message, "");
}

TEST_F(SockConnectionTest, AllocatesNothingForBytesThatAreAnnouncedButDoNotCome) {
  PeerWrites("\4\0\0\0abc"s);  // 64 MiB announced, three bytes sent
  ClosePeer();
  std::string message;
  EXPECT_FALSE(connection_.Recv(message));
  EXPECT_LT(message.capacity(), size_t{1} << 20);
}

TEST_F(SockConnectionTest, ReceivesNothingWhenThePeerClosesBeforeWithinOrAfterAHeader) {
  for (const std::string& wire : {""s, "\0\0"s, "\0\0\0\3"s, "\0\0\0\3ab"s}) {
    int ends[2];
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
    SockConnection connection(ends[1]);
    ASSERT_EQ(write(ends[0], wire.data(), wire.size()), static_cast<ssize_t>(wire.size()));
    close(ends[0]);
    std::string message = "before";
    EXPECT_FALSE(connection.Recv(message)) << wire.size();
    EXPECT_EQ(message, "");
  }
}

TEST_F(SockConnectionTest, ReportsAPeerThatIsGoneAndRaisesNoSignal) {
  ClosePeer();
  EXPECT_FALSE(connection_.Send("anybody there?"));  // SIGPIPE would end the test
}

TEST_F(SockConnectionTest, ResumesCallsThatASignalInterrupts) {
  struct sigaction action {};
  action.sa_handler = [](int) {};  // and no SA_RESTART
  struct sigaction before {};
  ASSERT_EQ(sigaction(SIGUSR1, &action, &before), 0);
  const pthread_t receiver = pthread_self();
  std::thread peer([&] {
    for (int i = 0; i < 50; ++i) {
      pthread_kill(receiver, SIGUSR1);
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    PeerWrites("\0\0\0\2ok"s);
  });
  std::string message;
  EXPECT_TRUE(connection_.Recv(message));
  peer.join();
  sigaction(SIGUSR1, &before, nullptr);
  EXPECT_EQ(message, "ok");
}

TEST_F(SockConnectionTest, SendsAndReceivesNothingOnceDisconnected) {
  connection_.Disconnect();
  std::string message = "before";
  EXPECT_FALSE(connection_.Send("x"));
  EXPECT_FALSE(connection_.Recv(message));
  EXPECT_EQ(message, "");
}

TEST_F(SockConnectionTest, ClosesItsDescriptorWhenDestroyed) {
  int ends[2];
  ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
  { const SockConnection connection(ends[1]); }
  EXPECT_EQ(fcntl(ends[1], F_GETFD), -1);
  close(ends[0]);
}

TEST(WireTest, AHeaderHoldsAnyLengthAndGivesItBack) {
  for (const uint32_t length : {0U, 1U, 0xffU, 0x100U, 0x01020304U, kLongestMessage, 0xffffffffU}) {
    EXPECT_EQ(DecodeHeader(EncodeHeader(length)), length);
  }
  EXPECT_EQ(EncodeHeader(0x01020304), (Header{1, 2, 3, 4}));
}

}  // namespace
}  // namespace quordaemon
