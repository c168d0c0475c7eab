#include "support/tool_run.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <ostream>
#include <span>
#include <stdexcept>
#include <string_view>
#include <system_error>

// The C library's header leaves this out.
extern "C" {
#include <sys/pidfd.h>
}

namespace quorelastic::testing {
namespace {

using Clock = std::chrono::steady_clock;

// The longest single write that is recorded whole.
constexpr size_t kLongestWrite = size_t{64} << 10;

int Checked(int result, const char* call) {
  if (result < 0) throw std::system_error(errno, std::generic_category(), call);
  return result;
}

Descriptor MemoryFile(const std::string& content) {
  Descriptor file(Checked(memfd_create("quorelastic-test", MFD_CLOEXEC), "memfd_create"));
  if (pwrite(file.get(), content.data(), content.size(), 0) != static_cast<ssize_t>(content.size())) {
    throw std::system_error(errno, std::generic_category(), "pwrite to memory");
  }
  return file;
}

std::string ReadMemoryFile(const Descriptor& file) {
  std::string content;
  std::array<char, 65536> piece;
  for (;;) {
    const ssize_t got = pread(file.get(), piece.data(), piece.size(), static_cast<off_t>(content.size()));
    if (Checked(static_cast<int>(got), "pread from memory") == 0) return content;
    content.append(piece.data(), static_cast<size_t>(got));
  }
}

bool IsInherited(std::string_view variable) {
  return !variable.starts_with("LANG") && !variable.starts_with("LC_") &&
         !variable.starts_with("POSIXLY_CORRECT=");
}

std::vector<char*> Pointers(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (std::string& text : texts) pointers.push_back(text.data());
  pointers.push_back(nullptr);
  return pointers;
}

// What the new process needs, made before it is forked: between fork and exec nothing may be allocated.
class Launch {
 public:
  Launch(const std::vector<std::string>& command, const RunOptions& options)
      : options_(options), command_(command), arguments_(Pointers(command_)) {
    for (char** variable = environ; *variable != nullptr; ++variable) {
      if (IsInherited(*variable)) environment_.emplace_back(*variable);
    }
    environment_.insert(environment_.end(), options.environment.begin(), options.environment.end());
    variables_ = Pointers(environment_);
  }

  [[noreturn]] void RunInChild(int in, int out, int err) {
    setpgid(0, 0);
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    bool ready = dup2(in, 0) == 0 && dup2(out, 1) == 1 && dup2(err, 2) == 2;
    const rlimit no_core{0, 0};
    ready = ready && setrlimit(RLIMIT_CORE, &no_core) == 0;
    for (const auto& [resource, value] : options_.limits) {
      const rlimit limit{value, value};
      ready = ready && setrlimit(resource, &limit) == 0;
    }
    if (!options_.folder.empty()) ready = ready && chdir(options_.folder.c_str()) == 0;
    if (ready) execvpe(arguments_[0], arguments_.data(), variables_.data());
    const char* reason = strerrordesc_np(errno);
    dprintf(2, "cannot run %s: %s\n", arguments_[0], reason);
    _exit(127);
  }

 private:
  const RunOptions& options_;
  std::vector<std::string> command_;
  std::vector<char*> arguments_;
  std::vector<std::string> environment_;
  std::vector<char*> variables_;
};

int MillisecondsUntil(Clock::time_point time) {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(time - Clock::now()).count();
  return left > 0 ? static_cast<int>(left) : 0;
}

// Takes what was written to `socket`, one message a write, until there is no more for now or ever.
void TakeWrites(const Descriptor& socket, std::vector<std::string>& writes) {
  std::string message(kLongestWrite, '\0');
  for (;;) {
    const ssize_t got = recv(socket.get(), message.data(), message.size(), MSG_DONTWAIT);
    if (got <= 0) return;
    writes.emplace_back(message, 0, static_cast<size_t>(got));
  }
}

std::string Concatenate(const std::vector<std::string>& pieces) {
  std::string whole;
  for (const std::string& piece : pieces) whole += piece;
  return whole;
}

}  // namespace

std::ostream& operator<<(std::ostream& stream, const RunResult& result) {
  if (result.signal != 0) {
    stream << "ended by signal " << result.signal;
  } else {
    stream << "exit status " << result.status;
  }
  return stream << "\nstandard output:\n" << result.out << "\nstandard error:\n" << result.err;
}

Process::Process(const std::vector<std::string>& command, const RunOptions& options)
    : command_(command),
      time_limit_(options.time_limit),
      status_tells_signal_(options.status_tells_signal),
      out_(MemoryFile("")),
      err_(MemoryFile("")) {
  Launch launch(command, options);
  const Descriptor in = MemoryFile(options.input);
  Descriptor far_end;
  if (options.record_writes) {
    int ends[2];
    Checked(socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends), "socketpair");
    writes_ = Descriptor(ends[0]);
    far_end = Descriptor(ends[1]);
  }
  pid_ = Checked(fork(), "fork");
  if (pid_ == 0) {
    launch.RunInChild(options.input_descriptor >= 0 ? options.input_descriptor : in.get(),
                      options.record_writes ? far_end.get() : out_.get(), err_.get());
  }
  setpgid(pid_, pid_);  // whoever of the two comes first
  process_ = Descriptor(Checked(pidfd_open(pid_, 0), "pidfd_open"));
}

Process::~Process() {
  if (process_.get() < 0) return;
  kill(-pid_, SIGKILL);
  waitpid(pid_, nullptr, 0);
}

std::string Process::Out() const { return ReadMemoryFile(out_); }

std::string Process::Err() const { return ReadMemoryFile(err_); }

void Process::Signal(int signal) const { kill(pid_, signal); }

void Process::AwaitEnd(RunResult& result) {
  const auto deadline = Clock::now() + time_limit_;
  for (;;) {
    std::array<pollfd, 2> watched{pollfd{process_.get(), POLLIN, 0}, pollfd{writes_.get(), POLLIN, 0}};
    const int ready = poll(watched.data(), watched.size(), MillisecondsUntil(deadline));
    if (ready < 0 && errno == EINTR) continue;
    Checked(ready, "poll");
    if (ready == 0) {
      kill(-pid_, SIGKILL);
      throw std::runtime_error(command_.front() + " did not end within " +
                               std::to_string(time_limit_.count()) + " s; until then it wrote\n" + Out() +
                               "\nand on standard error\n" + Err());
    }
    if (writes_.get() >= 0) {
      TakeWrites(writes_, result.writes);
      if (watched[1].revents & POLLHUP) writes_ = Descriptor();
    }
    if (watched[0].revents != 0) break;
  }
  if (writes_.get() >= 0) TakeWrites(writes_, result.writes);
}

RunResult Process::Wait() {
  RunResult result;
  result.pid = pid_;
  AwaitEnd(result);
  kill(-pid_, SIGKILL);  // what it may have left behind
  int status = 0;
  Checked(waitpid(pid_, &status, 0), "waitpid");
  process_ = Descriptor();
  if (WIFSIGNALED(status)) result.signal = WTERMSIG(status);
  if (WIFEXITED(status)) result.status = WEXITSTATUS(status);
  if (status_tells_signal_ && result.status > 128) {
    result.signal = std::exchange(result.status, -1) - 128;
  }
  result.out = result.writes.empty() ? Out() : Concatenate(result.writes);
  result.err = Err();
  return result;
}

RunResult RunCommand(const std::vector<std::string>& command, const RunOptions& options) {
  return Process(command, options).Wait();
}

const std::string& ToolPath() {
  static const std::string path = QUORELASTIC_TOOL;
  return path;
}

RunResult RunTool(const std::vector<std::string>& arguments, const RunOptions& options) {
  std::vector<std::string> command{ToolPath()};
  command.insert(command.end(), arguments.begin(), arguments.end());
  return RunCommand(command, options);
}

}  // namespace quorelastic::testing
