#pragma once

#include <gtest/gtest.h>

#include <string>

#include "daemon_client.h"
#include "daemon_process.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {

// A daemon that serves one index, "books", with the keyword "id" and the text "title".
class ServedIndex : public ::testing::Test {
 protected:
  explicit ServedIndex(const std::vector<std::string>& arguments = {}) : daemon_(folder_.path(), arguments) {
    EXPECT_TRUE(daemon_.is_ready()) << daemon_.Log();
    EXPECT_EQ(Connect().AskForError(kCreateBooks), "");
  }

  DaemonClient Connect() { return DaemonClient(daemon_.socket()); }

  // The documents of the last commit.
  static int CountBooks(DaemonClient& client) {
    return client
        .Ask(R"({"command":"index_list","data":{"id":"books"}})")["result"]["indexes"][0]["documents"]
        .asInt();
  }

  static constexpr const char* kCreateBooks =
      R"({"command":"index_create","data":{"id":"books","settings":{"fields":[{"name":"title","type":"text"}]}}})";

  TemporaryFolder folder_;
  DaemonProcess daemon_;
};

}  // namespace quorelastic::testing
