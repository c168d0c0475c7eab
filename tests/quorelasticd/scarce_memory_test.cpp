// What becomes of a server and its requests where memory runs out, at whichever allocation.

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <pthread.h>
#include <spdlog/spdlog.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <boost/asio/thread_pool.hpp>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <system_error>
#include <thread>
#include <utility>

#include "commands/command_service.h"
#include "commands/daemon.h"
#include "daemon_client.h"
#include "scarce_memory.h"
#include "server/listener.h"
#include "server/server.h"
#include "support/temporary_folder.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::DaemonClient;
using quorelastic::testing::ScarceMemory;
using quorelastic::testing::SparedThread;
using quorelastic::testing::TemporaryFolder;

constexpr int kForGood = std::numeric_limits<int>::max();

std::atomic<int> threads_to_come{kForGood};

// One step. Where a number is given, memory runs out at that allocation after it.
class OneStep : public Execution {
 public:
  OneStep(boost::asio::any_io_executor executor, int failing)
      : executor_(std::move(executor)), failing_(failing) {}

  boost::asio::any_io_executor executor() const override { return executor_; }

  Step Run() override {
    Step step{R"({"success":true})", true};
    if (failing_ > 0) scarce_.emplace(failing_);
    return step;
  }

 private:
  boost::asio::any_io_executor executor_;
  int failing_;
  std::optional<ScarceMemory> scarce_;
};

// Answers every request alike. One that is a number runs on threads apart, and memory runs out behind it.
class PlainService : public Service {
 public:
  std::unique_ptr<Execution> Begin(std::string request) override {
    const int failing = std::atoi(request.c_str());
    if (failing == 0) return std::make_unique<OneStep>(boost::asio::any_io_executor(), 0);
    return std::make_unique<OneStep>(threads_.get_executor(), failing);
  }

  std::string RefuseTooLong() override { return "{}"; }
  std::string RefuseTooManyConnections(size_t /*most*/) override { return "{}"; }
  std::string RefuseShuttingDown() override { return "{}"; }

 private:
  boost::asio::thread_pool threads_{1};
};

ServerLimits FewThreads() {
  ServerLimits limits;
  limits.threads = 3;
  return limits;
}

enum class Answer { kReply, kHungUp, kNone };

// Runs for good: for processes that end with it.
class RunningServer {
 public:
  explicit RunningServer(const std::string& folder) : path_(folder + "/socket"), listener_(path_) {
    server_.BeatEvery(std::chrono::milliseconds(50), [this] { ++beats_; });
    std::thread([this] { server_.Run([] {}); }).detach();
    Ask("first");
  }

  // What a new client gets in time.
  Answer Ask(const std::string& request) const {
    DaemonClient client(path_);
    const timeval patience{.tv_sec = 1, .tv_usec = 0};
    setsockopt(client.descriptor(), SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    if (!client.Send(request)) return Answer::kHungUp;
    char first = 0;
    const ssize_t got = recv(client.descriptor(), &first, 1, 0);
    return got > 0 ? Answer::kReply : got == 0 || errno == ECONNRESET ? Answer::kHungUp : Answer::kNone;
  }

  // Whether its watchdog would be content.
  bool Beats() const {
    const int before = beats_;
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    return beats_ > before;
  }

 private:
  std::string path_;
  PlainService service_;
  std::atomic<size_t> connections_{0};
  std::atomic<int> beats_{0};
  Listener listener_;
  Server server_{listener_.Release(), service_, FewThreads(), connections_};
};

// A sanitizer that ends a process has it exit with 1.
enum Outcome { kFine = 2, kWrong, kNotReached };

// Lets a child of this process do it with a server: what it returns, or kFine where the child died of it, since
// Boost.Asio allocates in places where it must not throw. A daemon that ends is started anew.
Outcome WithServer(const std::function<Outcome(const RunningServer&)>& action) {
  const TemporaryFolder folder;
  const pid_t child = fork();
  if (child == 0) {
    spdlog::set_level(spdlog::level::off);
    const SparedThread spared;
    _exit(action(*new RunningServer(folder.path())));
  }
  int status = 0;
  waitpid(child, &status, 0);
  const bool is_outcome =
      WIFEXITED(status) && WEXITSTATUS(status) >= kFine && WEXITSTATUS(status) <= kNotReached;
  return is_outcome ? Outcome(WEXITSTATUS(status)) : kFine;
}

TEST(ScarceMemory, NoServerIsDeafWhileItsHeartBeats) {
  for (int allocation = 1;; ++allocation) {
    const Outcome outcome = WithServer([&](const RunningServer& server) {
      {
        const ScarceMemory scarce(allocation);
        server.Ask("any");
        if (!ScarceMemory::HasFailed()) return kNotReached;
      }
      return server.Ask("any") == Answer::kReply || !server.Beats() ? kFine : kWrong;
    });
    if (outcome == kNotReached) break;
    EXPECT_EQ(outcome, kFine) << allocation;
  }
}

TEST(ScarceMemory, AClientIsHungUpOnWhereItsReplyCannotBeHandedOn) {
  const Outcome outcome = WithServer([](const RunningServer& server) {
    return server.Ask("1") == Answer::kHungUp && server.Ask("any") == Answer::kReply ? kNotReached : kWrong;
  });
  EXPECT_EQ(outcome, kNotReached);
}

TEST(ScarceMemory, AServerWithoutAllItsThreadsDoesNotStart) {
  const TemporaryFolder folder;
  PlainService service;
  std::atomic<size_t> connections{0};
  Listener listener(folder / "socket");
  Server server(listener.Release(), service, FewThreads(), connections);
  threads_to_come = 1;
  EXPECT_THROW(server.Run([] {}), std::system_error);
  threads_to_come = kForGood;
}

TEST(ScarceMemory, ARequestGetsItsReply) {
  const TemporaryFolder folder;
  const DataRoot root(folder.path());
  boost::asio::thread_pool threads(1);
  IndexRegistry registry(root, threads.get_executor(), 10);
  Statistics statistics;
  const vantrel::elastic::SearchPluginRegistry plugins;
  Turns turns(1);
  const Daemon daemon(registry, statistics, {plugins, turns, threads.get_executor(), std::chrono::seconds(1)},
                      {turns, threads.get_executor()});
  CommandService service(daemon);
  for (int allocation = 1;; ++allocation) {
    const auto execution = service.Begin(R"({"command":"index_delete"})");
    Execution::Step step;
    bool has_failed = false;
    {
      const ScarceMemory scarce(allocation, kForGood);
      step = execution->Run();
      has_failed = ScarceMemory::HasFailed();
    }
    ASSERT_TRUE(step.finished && step.reply.has_value());
    EXPECT_NE(step.reply->find(has_failed ? "out of memory" : "bad_request"), std::string::npos)
        << allocation << ": " << *step.reply;
    if (!has_failed) break;
  }
}

}  // namespace
}  // namespace quorelasticd

// Stands before the system's.
extern "C" __attribute__((visibility("default"))) int pthread_create(pthread_t* thread,
                                                                     const pthread_attr_t* attributes,
                                                                     void* (*start)(void*), void* argument) {
  static const auto real = reinterpret_cast<decltype(&pthread_create)>(dlsym(RTLD_NEXT, "pthread_create"));
  if (quorelasticd::threads_to_come <= 0) return EAGAIN;
  --quorelasticd::threads_to_come;
  return real(thread, attributes, start, argument);
}
