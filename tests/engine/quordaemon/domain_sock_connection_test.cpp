#include "quordaemon/domain_sock_connection.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstring>
#include <string>
#include <thread>
#include <type_traits>
#include <vector>

#include "support/files.h"
#include "support/temporary_folder.h"

namespace quordaemon {
namespace {

using ::quorelastic::testing::TemporaryFolder;

class Listener {
 public:
  explicit Listener(const std::string& path) : sock_(socket(AF_UNIX, SOCK_STREAM, 0)) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, path.data(), path.size());
    EXPECT_EQ(bind(sock_, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    EXPECT_EQ(listen(sock_, 8), 0);
    const timeval patience{10, 0};
    EXPECT_EQ(setsockopt(sock_, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience), 0);
  }
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;
  ~Listener() { close(sock_); }

  int Accept() const { return accept(sock_, nullptr, nullptr); }

 private:
  int sock_;
};

TEST(DomainSockConnectionTest, ConnectsToWhoListensAtThePath) {
  const TemporaryFolder folder;
  const Listener listener(folder / "sock");
  DomainSockConnection connection(folder / "sock");
  ASSERT_TRUE(connection.Connect());
  SockConnection accepted(listener.Accept());
  ASSERT_TRUE(connection.Send("hello"));
  std::string message;
  ASSERT_TRUE(accepted.Recv(message));
  EXPECT_EQ(message, "hello");
}

TEST(DomainSockConnectionTest, DoesNotConnectWhereNobodyListens) {
  const TemporaryFolder folder;
  EXPECT_FALSE(DomainSockConnection(folder / "missing").Connect());
  quorelastic::testing::WriteFile(folder / "file", "no socket");
  EXPECT_FALSE(DomainSockConnection(folder / "file").Connect());
  { const Listener gone(folder / "stale"); }
  EXPECT_FALSE(DomainSockConnection(folder / "stale").Connect());
}

TEST(DomainSockConnectionTest, DoesNotConnectToAPathThatFitsNoAddress) {
  const TemporaryFolder folder;
  EXPECT_FALSE(DomainSockConnection("").Connect());
  EXPECT_FALSE(DomainSockConnection(folder / std::string(200, 'x')).Connect());
}

TEST(DomainSockConnectionTest, ConnectingAgainLeavesTheFirstConnection) {
  const TemporaryFolder folder;
  const Listener listener(folder / "sock");
  DomainSockConnection connection(folder / "sock");
  ASSERT_TRUE(connection.Connect());
  SockConnection first(listener.Accept());
  ASSERT_TRUE(connection.Connect());
  SockConnection second(listener.Accept());
  std::string message;
  EXPECT_FALSE(first.Recv(message));
  ASSERT_TRUE(connection.Send("x"));
  EXPECT_TRUE(second.Recv(message));
}

TEST(DomainSockConnectionTest, ItsDescriptorIsNotInheritedByPrograms) {
  const TemporaryFolder folder;
  const Listener listener(folder / "sock");
  const int next_free = dup(0);
  close(next_free);
  DomainSockConnection connection(folder / "sock");
  ASSERT_TRUE(connection.Connect());
  EXPECT_EQ(fcntl(next_free, F_GETFD), FD_CLOEXEC);
}

TEST(DomainSockConnectionTest, ItsDescriptorNeverStandsInForAClosedStandardStream) {
  const TemporaryFolder folder;
  const Listener listener(folder / "sock");
  const int kept = dup(0);
  close(0);
  DomainSockConnection connection(folder / "sock");
  EXPECT_TRUE(connection.Connect());
  EXPECT_EQ(fcntl(0, F_GETFD), -1);
  dup2(kept, 0);
  close(kept);
  const SockConnection accepted(listener.Accept());
  EXPECT_TRUE(connection.Send("x"));
}

TEST(DomainSockConnectionTest, GoesOnConnectingAfterASignal) {
  const TemporaryFolder folder;
  const Listener listener(folder / "sock");
  // As many connections as the system lets wait for the listener; the next has to wait itself.
  std::vector<int> waiting;
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  (folder / "sock").copy(address.sun_path, sizeof address.sun_path);
  do {
    waiting.push_back(socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0));
  } while (connect(waiting.back(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0);

  struct sigaction action {};
  action.sa_handler = [](int) {};  // and no SA_RESTART
  struct sigaction before {};
  ASSERT_EQ(sigaction(SIGUSR1, &action, &before), 0);
  const pthread_t connecting = pthread_self();
  std::thread peer([&] {
    for (int i = 0; i < 50; ++i) {
      pthread_kill(connecting, SIGUSR1);
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    for (size_t i = 1; i < waiting.size(); ++i) close(listener.Accept());
    SockConnection accepted(listener.Accept());
    std::string message;
    EXPECT_TRUE(accepted.Recv(message));
    EXPECT_EQ(message, "hello");
  });
  DomainSockConnection connection(folder / "sock");
  EXPECT_TRUE(connection.Connect());
  EXPECT_TRUE(connection.Send("hello"));
  connection.Disconnect();
  peer.join();
  sigaction(SIGUSR1, &before, nullptr);
  for (const int sock : waiting) close(sock);
}

TEST(DomainSockConnectionTest, IsDestroyedThroughItsBase) {
  static_assert(std::has_virtual_destructor_v<SockConnection>);
  static_assert(std::is_base_of_v<SockConnection, DomainSockConnection>);
}

}  // namespace
}  // namespace quordaemon
