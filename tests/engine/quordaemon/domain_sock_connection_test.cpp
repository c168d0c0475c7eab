#include "quordaemon/domain_sock_connection.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstring>
#include <string>
#include <type_traits>

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

TEST(DomainSockConnectionTest, IsDestroyedThroughItsBase) {
  static_assert(std::has_virtual_destructor_v<SockConnection>);
  static_assert(std::is_base_of_v<SockConnection, DomainSockConnection>);
}

}  // namespace
}  // namespace quordaemon
