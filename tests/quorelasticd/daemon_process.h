#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

namespace quorelastic::testing {

// A real daemon, with its socket, its data and its log in a folder of the test.
class DaemonProcess {
 public:
  // Starts it with further arguments and waits until it says that it is ready, or has ended. `listener`, where
  // given, is passed to it as a service manager does.
  explicit DaemonProcess(const std::string& folder, const std::vector<std::string>& arguments = {},
                         int listener = -1);
  DaemonProcess(const DaemonProcess&) = delete;
  DaemonProcess& operator=(const DaemonProcess&) = delete;

  // Kills it where it still runs.
  ~DaemonProcess();

  const std::string& socket() const { return socket_; }
  const std::string& data() const { return data_; }
  pid_t pid() const { return pid_; }
  bool is_ready() const { return is_ready_; }

  // What it told the service manager so far, a message each.
  std::vector<std::string> Notifications();

  // What it logged so far.
  std::string Log() const;

  // Does nothing where it was seen to end.
  void Signal(int signal) const;

  // Waits until it ends: its exit status, or minus the signal that ended it.
  int Wait();

  // Asks it to end, and waits.
  int Stop();

 private:
  void Start(const std::vector<std::string>& arguments, int listener);
  void WaitUntilReady();
  bool HasEnded();

  std::string socket_;
  std::string data_;
  std::string log_;
  std::string notify_path_;
  int notify_socket_ = -1;
  std::vector<std::string> notifications_;
  pid_t pid_ = -1;
  bool has_ended_ = false;
  int status_ = 0;
  bool is_ready_ = false;
};

// Runs the daemon's program to its end, which must be soon: what it wrote on both streams, and its exit status.
struct ProgramRun {
  std::string output;
  int status = 0;
};
ProgramRun RunDaemonProgram(const std::vector<std::string>& arguments);

}  // namespace quorelastic::testing
