// Checks and repairs read whole indexes, so that only a few may run at a time.

#include <gtest/gtest.h>

#include <boost/asio/thread_pool.hpp>
#include <optional>

#include "base/limits.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "errors/request_error.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_settings.h"

namespace quorelasticd {
namespace {

class HealthTurnsTest : public ::testing::Test {
 protected:
  HealthTurnsTest() { registry_.Create("x", {.fields = {{.name = "text"}}}); }

  std::unique_ptr<RunningCommand> Begin(const Command& command) const {
    Json::Value data(Json::objectValue);
    data["id"] = "x";
    return command.begin(daemon_, std::move(data));
  }

  quorelastic::testing::TemporaryFolder folder_;
  DataRoot root_{folder_.path()};
  boost::asio::thread_pool threads_{1};
  IndexRegistry registry_{root_, threads_.get_executor(), 10};
  Statistics statistics_;
  vantrel::elastic::SearchPluginRegistry plugins_;
  Turns searches_{1};
  Turns turns_{1};
  const Daemon daemon_{registry_,
                       statistics_,
                       {plugins_, searches_, threads_.get_executor(), std::chrono::seconds(1)},
                       {turns_, threads_.get_executor()}};
};

TEST_F(HealthTurnsTest, AreTakenAsLongAsACheckOrARepairLives) {
  auto running = Begin(CheckCommand());
  for (const Command& command : {CheckCommand(), RepairCommand()}) {
    try {
      Begin(command);
      ADD_FAILURE() << command.name << " was begun";
    } catch (const RequestError& error) {
      EXPECT_EQ(error.code(), ErrorCode::kLimitExceeded);
      EXPECT_EQ(error.details()["limit"].asString(), "health_runs");
      EXPECT_EQ(error.details()["most"].asInt64(), kMostHealthRuns);
    }
  }
  running.reset();
  running = Begin(RepairCommand());
  EXPECT_THROW(Begin(CheckCommand()), RequestError);
  running.reset();
  EXPECT_NE(Begin(CheckCommand()), nullptr);
}

}  // namespace
}  // namespace quorelasticd
