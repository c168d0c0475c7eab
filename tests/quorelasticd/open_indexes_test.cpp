// How a daemon serves more indexes than it may hold open.

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <string>

#include "daemon_client.h"
#include "daemon_process.h"
#include "support/open_files.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

TEST(OpenIndexes, MoreThanMayBeOpenAreAllServedWithFewDescriptors) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path(), {"--max-open-indexes", "5"});
  constexpr int kIndexes = 60;
  const auto name = [](int i) { return "\"x" + std::to_string(i) + "\""; };
  const auto search = [&](DaemonClient& client, int i) {
    return client.Ask(R"({"command":"search","data":{"indice":[)" + name(i) +
                      R"(],"query_string":{"query":"word"}}})")["result"]["total"];
  };
  size_t most = 0;
  DaemonClient client(daemon.socket());
  for (int i = 0; i < kIndexes; ++i) {
    ASSERT_EQ(client.AskForError(R"({"command":"index_create","data":{"id":)" + name(i) +
                                 R"(,"settings":{"fields":[{"name":"t","type":"text"}]}}})"),
              "");
    // Every other one is left with a change that is not committed.
    ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":)" + name(i) +
                                 R"(,"documents":[{"id":"1","t":"word"}]}})"),
              "");
    ASSERT_EQ(client.AskForError(R"({"command":"document_bulk","data":{"id":)" + name(i) +
                                 R"(,"documents":[{"id":"2","t":"word"}],"commit":)" +
                                 (i % 2 == 0 ? "true" : "false") + "}}"),
              "");
    EXPECT_GE(search(client, i), i % 2 == 0 ? 2 : 1);
    most = std::max(most, CountOpenFiles(daemon.pid()));
  }
  for (int i = 0; i < kIndexes; ++i) EXPECT_GE(search(client, i), i % 2 == 0 ? 2 : 1) << i;
  most = std::max(most, CountOpenFiles(daemon.pid()));
  EXPECT_LT(most, 200U);
  // What has changes is committed in the background, and closed when the next index is opened.
  const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(60);
  int opened = 0;
  while (client.Ask(R"({"command":"status"})")["result"]["open_indexes"].asInt() > 5) {
    ASSERT_LT(std::chrono::steady_clock::now(), give_up);
    search(client, opened++ % kIndexes);
  }
  ASSERT_EQ(daemon.Stop(), 0);
  DaemonProcess again(folder.path());
  DaemonClient other(again.socket());
  for (int i = 0; i < kIndexes; ++i) EXPECT_EQ(search(other, i), 2) << i;
}

}  // namespace
}  // namespace quorelastic::testing
