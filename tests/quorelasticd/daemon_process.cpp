#include "daemon_process.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <stdexcept>

#include "support/files.h"

namespace quorelastic::testing {
namespace {

// Replaces this process, a fresh child, by the daemon.
[[noreturn]] void Execute(const std::vector<std::string>& arguments) {
  std::vector<char*> argv;
  argv.push_back(const_cast<char*>(QUORELASTICD_PROGRAM));
  for (const std::string& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
  argv.push_back(nullptr);
  execv(QUORELASTICD_PROGRAM, argv.data());
  _exit(127);
}

// The convention of systemd: descriptor 3, and two variables.
void PassListener(int listener) {
  constexpr int kFirstPassed = 3;
  dup2(listener, kFirstPassed);
  setenv("LISTEN_FDS", "1", 1);
  setenv("LISTEN_PID", std::to_string(getpid()).c_str(), 1);
}

int BindDatagramSocket(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  if (path.size() >= sizeof address.sun_path) throw std::runtime_error("too long a path: " + path);
  std::memcpy(address.sun_path, path.data(), path.size());
  unlink(path.c_str());
  const int sock = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
  if (sock == -1 || bind(sock, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
    throw std::runtime_error("cannot bind " + path);
  }
  return sock;
}

int ToStatus(int status) { return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status); }

}  // namespace

DaemonProcess::DaemonProcess(const std::string& folder, const std::vector<std::string>& arguments,
                             int listener)
    : socket_(folder + "/socket"),
      data_(folder + "/data"),
      log_(folder + "/log"),
      notify_path_(folder + "/notify"),
      notify_socket_(BindDatagramSocket(notify_path_)) {
  Start(arguments, listener);
  WaitUntilReady();
}

DaemonProcess::~DaemonProcess() {
  if (!has_ended_) {
    kill(pid_, SIGKILL);
    Wait();
  }
  close(notify_socket_);
}

void DaemonProcess::Start(const std::vector<std::string>& arguments, int listener) {
  std::vector<std::string> all = {"--socket", socket_, "--data", data_};
  all.insert(all.end(), arguments.begin(), arguments.end());
  pid_ = fork();
  if (pid_ == -1) throw std::runtime_error("cannot fork");
  if (pid_ != 0) return;
  setenv("NOTIFY_SOCKET", notify_path_.c_str(), 1);
  const int log = open(log_.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
  dup2(log, STDERR_FILENO);
  if (listener != -1) PassListener(listener);
  Execute(all);
}

void DaemonProcess::WaitUntilReady() {
  while (!is_ready_ && !HasEnded()) {
    pollfd entry{notify_socket_, POLLIN, 0};
    poll(&entry, 1, 20);
    for (const std::string& text : Notifications()) is_ready_ = is_ready_ || text.starts_with("READY=1");
  }
}

std::vector<std::string> DaemonProcess::Notifications() {
  std::array<char, 4096> buffer;
  for (;;) {
    const ssize_t got = recv(notify_socket_, buffer.data(), buffer.size(), 0);
    if (got <= 0) return notifications_;
    notifications_.emplace_back(buffer.data(), static_cast<size_t>(got));
  }
}

std::string DaemonProcess::Log() const { return ReadFile(log_); }

void DaemonProcess::Signal(int signal) const {
  // The number of a process that was waited for may be another's by now.
  if (!has_ended_) kill(pid_, signal);
}

bool DaemonProcess::HasEnded() {
  int status = 0;
  if (!has_ended_ && waitpid(pid_, &status, WNOHANG) == pid_) {
    has_ended_ = true;
    status_ = ToStatus(status);
  }
  return has_ended_;
}

int DaemonProcess::Wait() {
  int status = 0;
  if (!has_ended_ && waitpid(pid_, &status, 0) == pid_) {
    has_ended_ = true;
    status_ = ToStatus(status);
  }
  return status_;
}

int DaemonProcess::Stop() {
  Signal(SIGTERM);
  return Wait();
}

ProgramRun RunDaemonProgram(const std::vector<std::string>& arguments) {
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("cannot make a pipe");
  const pid_t pid = fork();
  if (pid == -1) throw std::runtime_error("cannot fork");
  if (pid == 0) {
    dup2(ends[1], STDOUT_FILENO);
    dup2(ends[1], STDERR_FILENO);
    Execute(arguments);
  }
  close(ends[1]);
  ProgramRun run;
  std::array<char, 4096> buffer;
  for (ssize_t got = 0; (got = read(ends[0], buffer.data(), buffer.size())) > 0;) {
    run.output.append(buffer.data(), static_cast<size_t>(got));
  }
  close(ends[0]);
  int status = 0;
  waitpid(pid, &status, 0);
  run.status = ToStatus(status);
  return run;
}

}  // namespace quorelastic::testing
