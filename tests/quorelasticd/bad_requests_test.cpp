// What is malformed, refused or damaged, as a client sees it: always one final reply with a code, and a connection
// that goes on where the framing is whole.

#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/socket.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "quordaemon/wire.h"
#include "served_index.h"
#include "support/files.h"
#include "support/sanitized.h"
#include "vantrel/elastic/write_lock.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;

class BadRequestsTest : public ServedIndex {};

TEST_F(BadRequestsTest, EveryMalformedRequestGetsOneReplyAndTheConnectionGoesOn) {
  DaemonClient client = Connect();
  const std::string deep(100000, '[');
  const struct {
    std::string request;
    std::string code;
  } cases[] = {
      {"", "bad_request"},
      {std::string(1, '\0'), "bad_request"},
      {"\xff\xfe", "bad_request"},
      {"{", "bad_request"},
      {"[]", "bad_request"},
      {"null", "bad_request"},
      {"\"status\"", "bad_request"},
      {"{}", "bad_request"},
      {R"({"command":null})", "bad_request"},
      {R"({"command":["status"]})", "bad_request"},
      {R"({"command":"status","data":[]})", "bad_request"},
      {R"({"command":"status","data":{"x":1}})", "bad_request"},
      {R"({"command":"status","extra":1})", "bad_request"},
      {R"({"command":"status","request_id":{}})", "bad_request"},
      {R"({"command":""})", "unknown_command"},
      {R"({"command":"Status"})", "unknown_command"},
      {R"({"command":"status\u0000"})", "unknown_command"},
      {R"({"command":"commit","data":{"id":"../books"}})", "index_not_found"},
      {R"({"command":"commit","data":{"id":"books\u0000"}})", "index_not_found"},
      {R"({"command":"commit","data":{"id":"\udc00"}})", "bad_request"},
      {R"(/* how is it? */ {"command":"status"})", "bad_request"},
      {"\xef\xbb\xbf"
       R"({"command":"status"})",
       "bad_request"},
      {R"({"command":"status","command":"status"})", "bad_request"},
      {deep, "limit_exceeded"},
      {R"({"command":)" + deep, "limit_exceeded"},
  };
  for (const auto& [request, code] : cases) {
    const auto replies = client.Exchange(request);
    ASSERT_EQ(replies.size(), 1u) << request.substr(0, 80);
    const JsonValue& reply = replies.front();
    EXPECT_FALSE(reply["success"].asBool());
    EXPECT_EQ(reply["error"]["code"].asString(), code) << request.substr(0, 80) << reply.toString();
    EXPECT_NE(reply["error"]["reason"].asString(), "");
    EXPECT_TRUE(reply["took_ms"].isUInt64());
  }
  EXPECT_EQ(client.AskForError(R"({"command":"status"})"), "");
}

TEST_F(BadRequestsTest, AnAnnouncementOfTooLongAMessageEndsTheConnection) {
  for (const std::string& header : {std::string("\x04\x00\x00\x01", 4), std::string("\xff\xff\xff\xff")}) {
    DaemonClient client = Connect();
    ASSERT_EQ(send(client.descriptor(), header.data(), header.size(), MSG_NOSIGNAL), 4);
    const JsonValue reply = client.Receive();
    EXPECT_EQ(reply["error"]["code"].asString(), "limit_exceeded");
    EXPECT_EQ(reply["error"]["limit"].asString(), "message_bytes");
    EXPECT_TRUE(client.IsHungUp());
  }
}

TEST_F(BadRequestsTest, TheLongestMessageIsRead) {
  DaemonClient client = Connect();
  std::string request = R"({"command":"status","x":")";
  request += std::string(quordaemon::kLongestMessage - request.size() - 2, 'x') + "\"}";
  ASSERT_EQ(request.size(), quordaemon::kLongestMessage);
  EXPECT_EQ(client.AskForError(request), "bad_request");
}

TEST_F(BadRequestsTest, AnIndexThatAnotherProcessWritesToIsLocked) {
  DaemonClient client = Connect();
  const vantrel::elastic::WriteLock lock(daemon_.data() + "/books");
  EXPECT_EQ(
      client.AskForError(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1"}]}})"),
      "locked");
  EXPECT_EQ(client.AskForError(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"),
            "locked");
  EXPECT_EQ(CountBooks(client), 0);
}

TEST_F(BadRequestsTest, AnIndexInUseIsNotDeleted) {
  DaemonClient client = Connect();
  const std::string words = ManyWords(50000);
  ASSERT_EQ(client.AskForError(
                R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"1","title":")" +
                words + "\"}]}}"),
            "");
  DaemonClient reader = Connect();  // and its replies fill the socket before they end
  ASSERT_TRUE(reader.Send(R"({"command":"terms","data":{"id":"books","max":1000000}})"));
  reader.Receive();
  EXPECT_EQ(client.AskForError(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"),
            "locked");
  reader.ReceiveFinal();
  EXPECT_EQ(client.AskForError(R"({"command":"index_delete","data":{"id":"books","confirm":"books"}})"), "");
}

TEST_F(BadRequestsTest, DamageIsCorruptAndNamesTheFile) {
  const std::string books = daemon_.data() + "/books";
  const std::string segments = FindFile(books, "_1");
  WriteFile(books + "/" + segments, "garbage");
  DaemonClient client = Connect();
  const JsonValue reply = client.Ask(R"({"command":"index_list","data":{"id":"books"}})");
  EXPECT_EQ(reply["error"]["code"].asString(), "corrupt");
  EXPECT_NE(reply["error"]["reason"].asString().find(segments), std::string::npos) << reply.toString();
}

TEST_F(BadRequestsTest, AFileThatCannotBeReadIsAnIoError) {
  fs::remove(daemon_.data() + "/books/quorelastic.json");
  DaemonClient client = Connect();
  EXPECT_EQ(client.AskForError(R"({"command":"commit","data":{"id":"books"}})"), "io_error");
}

// The address space that a process takes, in bytes.
rlim_t AddressSpace(pid_t pid) {
  std::ifstream file("/proc/" + std::to_string(pid) + "/statm");
  rlim_t pages = 0;
  file >> pages;
  return pages * 4096;
}

// An array of so many values, itself not counted.
std::string EmptyArrays(int count) {
  std::string text = "[[]";
  for (int i = 1; i < count; ++i) text += ",[]";
  return text + "]";
}

TEST_F(BadRequestsTest, RunningOutOfMemoryFailsTheRequestAndNotTheDaemon) {
  if (kIsSanitized) GTEST_SKIP() << "a sanitizer ends the process when memory runs out";
  DaemonClient client = Connect();
  const JsonValue before = client.Ask(R"({"command":"status"})");
  const rlim_t most = AddressSpace(daemon_.pid()) + (rlim_t{128} << 20);
  const rlimit limit{most, most};
  ASSERT_EQ(prlimit(daemon_.pid(), RLIMIT_AS, &limit, nullptr), 0);
  const JsonValue reply =
      client.Ask(R"({"command":"commit","request_id":"r","data":)" + EmptyArrays(1000000) + "}");
  EXPECT_EQ(reply["error"]["code"].asString(), "internal");
  EXPECT_EQ(reply["error"]["reason"].asString(), "out of memory");
  EXPECT_EQ(reply["command"].asString(), "commit");
  EXPECT_EQ(reply["request_id"].asString(), "r");
  const JsonValue after = client.Ask(R"({"command":"status"})");
  EXPECT_EQ(after["result"]["failed_requests"].asUInt(), before["result"]["failed_requests"].asUInt() + 1);
}

// Bytes of memory that a process holds.
size_t Resident(pid_t pid) {
  std::ifstream file("/proc/" + std::to_string(pid) + "/statm");
  size_t all = 0;
  size_t resident = 0;
  file >> all >> resident;
  return resident * 4096;
}

TEST_F(BadRequestsTest, MemoryOfALargeRequestIsGivenBack) {
  if (kIsSanitized) GTEST_SKIP() << "a sanitizer keeps what was freed";
  DaemonClient client = Connect();
  ASSERT_EQ(client.AskForError(R"({"command":"status"})"), "");
  const size_t before = Resident(daemon_.pid());
  const std::string request = R"({"command":"status","data":)" + EmptyArrays(1000000) + "}";
  for (int i = 0; i < 3; ++i) EXPECT_EQ(client.AskForError(request), "bad_request");
  const size_t most = before + (size_t{32} << 20);
  const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(5);
  do {  // the memory goes with a reply, if not with the very first
    ASSERT_EQ(client.AskForError(R"({"command":"status"})"), "");
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  } while (Resident(daemon_.pid()) >= most && std::chrono::steady_clock::now() < give_up);
  EXPECT_LT(Resident(daemon_.pid()), most);
}

TEST_F(BadRequestsTest, NoMoreIndexesThanTheLimit) {
  for (int i = 0; i < 999; ++i) fs::create_directory(daemon_.data() + "/x" + std::to_string(i));
  DaemonClient client = Connect();
  const JsonValue reply = client.Ask(
      R"({"command":"index_create","data":{"id":"y","settings":{"fields":[{"name":"text","type":"text"}]}}})");
  EXPECT_EQ(reply["error"]["code"].asString(), "limit_exceeded") << reply.toString();
  EXPECT_EQ(reply["error"]["most"].asInt(), 1000);
}

}  // namespace
}  // namespace quorelastic::testing
