#include "support/sandbox.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <array>
#include <cerrno>
#include <filesystem>
#include <system_error>
#include <utility>

#include "support/files.h"

namespace quorelastic::testing {
namespace {

// Far above what the tool sends.
constexpr size_t kLongestMessage = size_t{64} << 10;

Descriptor ListenForMessages(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof(address.sun_path))
    throw std::runtime_error("path too long for a socket: " + path);
  path.copy(address.sun_path, path.size());
  Descriptor listening(socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0));
  if (bind(listening.get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address)) != 0) {
    throw std::system_error(errno, std::generic_category(), "cannot bind " + path);
  }
  return listening;
}

std::string FindRefusal() {
  Sandbox sandbox;
  const RunResult trial = sandbox.RunCommand({"true"});
  if (trial.status == 0) return "";
  return trial.err.empty() ? "bwrap failed without a word" : trial.err;
}

}  // namespace

const std::string& Sandbox::Refusal() {
  static const std::string refusal = FindRefusal();
  return refusal;
}

Sandbox::Sandbox() : log_socket_(ListenForMessages(folder_ / "log")), stop_(eventfd(0, EFD_CLOEXEC)) {
  std::filesystem::create_directory(run_folder());
  std::filesystem::create_directory(data_root());
  collector_ = std::thread([this] { CollectLog(); });
}

Sandbox::~Sandbox() {
  eventfd_write(stop_.get(), 1);
  collector_.join();
}

std::vector<std::string> Sandbox::Wrap(const std::vector<std::string>& command) const {
  // The build tree is bound anew, because it may lie under one of the folders that are replaced. The shell
  // leaves the process id that the command keeps.
  std::vector<std::string> wrapped{"bwrap",
                                   "--die-with-parent",
                                   "--cap-drop",
                                   "ALL",
                                   "--ro-bind",
                                   "/",
                                   "/",
                                   "--dev",
                                   "/dev",
                                   "--bind",
                                   folder_ / "log",
                                   "/dev/log",
                                   "--tmpfs",
                                   "/var/lib",
                                   "--bind",
                                   data_root(),
                                   "/var/lib/quorelastic",
                                   "--bind",
                                   run_folder(),
                                   "/run",
                                   "--ro-bind",
                                   QUORELASTIC_BUILD_FOLDER,
                                   QUORELASTIC_BUILD_FOLDER,
                                   "--bind",
                                   folder(),
                                   folder()};
  for (const std::string& path : hidden_) wrapped.insert(wrapped.end(), {"--tmpfs", path});
  wrapped.insert(wrapped.end(), {"--", "sh", "-c", "echo $$ > \"$0\"; exec \"$@\"", folder_ / "pid"});
  wrapped.insert(wrapped.end(), command.begin(), command.end());
  return wrapped;
}

Process Sandbox::Start(const std::vector<std::string>& command, RunOptions options) const {
  options.status_tells_signal = true;
  return Process(Wrap(command), options);
}

RunResult Sandbox::RunCommand(const std::vector<std::string>& command, RunOptions options) const {
  std::filesystem::remove(folder_ / "pid");
  RunResult result = Start(command, std::move(options)).Wait();
  if (std::filesystem::exists(folder_ / "pid")) result.pid = std::stoi(ReadFile(folder_ / "pid"));
  return result;
}

RunResult Sandbox::RunTool(const std::vector<std::string>& arguments, const RunOptions& options) const {
  std::vector<std::string> command{ToolPath()};
  command.insert(command.end(), arguments.begin(), arguments.end());
  return RunCommand(command, options);
}

void Sandbox::DrainLog() {
  const std::lock_guard lock(log_mutex_);
  std::string message(kLongestMessage, '\0');
  for (;;) {
    const ssize_t got = recv(log_socket_.get(), message.data(), message.size(), MSG_DONTWAIT);
    if (got < 0) return;
    log_.emplace_back(message, 0, static_cast<size_t>(got));
  }
}

void Sandbox::CollectLog() {
  for (;;) {
    std::array<pollfd, 2> watched{pollfd{log_socket_.get(), POLLIN, 0}, pollfd{stop_.get(), POLLIN, 0}};
    if (poll(watched.data(), watched.size(), -1) < 0) continue;
    if (watched[1].revents != 0) return;
    DrainLog();
  }
}

std::vector<std::string> Sandbox::Log() {
  DrainLog();
  const std::lock_guard lock(log_mutex_);
  return log_;
}

}  // namespace quorelastic::testing
