#pragma once

#include <memory>
#include <string>

#include "commands/daemon.h"
#include "server/service.h"

namespace quorelasticd {

// Serves the commands of the table.
class CommandService : public Service {
 public:
  // `daemon` must outlive the service and all its executions.
  explicit CommandService(const Daemon& daemon) : daemon_(daemon) {}

  std::unique_ptr<Execution> Begin(std::string request) override;
  std::string RefuseTooLong() override;
  std::string RefuseTooManyConnections(size_t most) override;
  std::string RefuseShuttingDown() override;

 private:
  const Daemon& daemon_;
};

}  // namespace quorelasticd
