#include "support/background_process.h"

#include <sys/wait.h>

#include <chrono>
#include <csignal>
#include <stdexcept>
#include <thread>

#include "quordaemon/domain_sock_connection.h"
#include "support/timed_run.h"

namespace quorelastic::bench {

BackgroundProcess::BackgroundProcess(const std::vector<std::string>& command, const std::string& socket)
    : process_(Start(command)) {
  for (int tries = 0; tries < 200; ++tries) {
    if (quordaemon::DomainSockConnection(socket).Connect()) return;
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
  }
  kill(process_, SIGKILL);
  waitpid(process_, nullptr, 0);
  throw std::runtime_error(command[0] + " does not listen on " + socket);
}

BackgroundProcess::~BackgroundProcess() {
  kill(process_, SIGKILL);
  waitpid(process_, nullptr, 0);
}

}  // namespace quorelastic::bench
