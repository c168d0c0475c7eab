#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

namespace quorelastic::bench {

// A program that runs beside the measurements; killed when this goes.
class BackgroundProcess {
 public:
  // Starts it and waits until `socket`, which it is to make, can be connected to. Throws std::runtime_error where
  // that does not come to pass.
  BackgroundProcess(const std::vector<std::string>& command, const std::string& socket);
  BackgroundProcess(const BackgroundProcess&) = delete;
  BackgroundProcess& operator=(const BackgroundProcess&) = delete;
  ~BackgroundProcess();

 private:
  pid_t process_;
};

}  // namespace quorelastic::bench
