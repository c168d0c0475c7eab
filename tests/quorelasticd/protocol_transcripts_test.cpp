// Replays every transcript of docs/protocol.md, in their order, against a real daemon.

#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/socket.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "daemon_client.h"
#include "daemon_process.h"
#include "errors/error_code.h"
#include "protocol_document.h"
#include "quordaemon/wire.h"
#include "support/files.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/write_lock.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;

// Numbers that differ from run to run.
const std::set<std::string> kVolatile = {"took_ms",     "size_bytes", "uptime_s",
                                         "connections", "requests",   "failed_requests",
                                         "bytes",       "score",      "max_score"};

constexpr const char* kDataInDocument = "/var/lib/quorelastic";

// The same but for volatile numbers.
bool Matches(const Json::Value& expected, const Json::Value& actual, const std::string& name = "") {
  if (kVolatile.contains(name)) return expected.isNumeric() && actual.isNumeric();
  if (expected.isObject() && actual.isObject()) {
    if (expected.getMemberNames() != actual.getMemberNames()) return false;
    for (const std::string& member : expected.getMemberNames()) {
      if (!Matches(expected[member], actual[member], member)) return false;
    }
    return true;
  }
  if (expected.isArray() && actual.isArray()) {
    if (expected.size() != actual.size()) return false;
    for (Json::ArrayIndex i = 0; i < expected.size(); ++i) {
      if (!Matches(expected[i], actual[i])) return false;
    }
    return true;
  }
  return expected == actual;
}

class ProtocolTranscripts : public ::testing::Test {
 protected:
  void Start(const std::vector<std::string>& arguments = {}) {
    client_.reset();
    if (daemon_ != nullptr) daemon_->Stop();
    daemon_.reset();
    daemon_ = std::make_unique<DaemonProcess>(folder_.path(), arguments);
    ASSERT_TRUE(daemon_->is_ready()) << daemon_->Log();
    client_ = std::make_unique<DaemonClient>(daemon_->socket());
    for (const auto& [name, text] : document_.import_files)
      WriteFile(daemon_->data() + "/import/" + name, text);
  }

  std::string Path(const std::string& name) const { return daemon_->data() + "/books/" + name; }

  // Reads one reply and compares it with a line of the document.
  void Expect(const std::string& line) {
    std::string text;
    ASSERT_TRUE(client_->Recv(text));
    for (size_t at = 0; (at = text.find(daemon_->data(), at)) != std::string::npos;) {
      text.replace(at, daemon_->data().size(), kDataInDocument);
    }
    JsonValue actual;
    ASSERT_TRUE(actual.fromString(text)) << text;
    JsonValue expected;
    ASSERT_TRUE(expected.fromString(line)) << line;
    EXPECT_EQ(expected.toString(), line) << "the document lays it out differently";
    EXPECT_TRUE(Matches(expected, actual)) << "the document: " << line << "\nthe daemon:   " << text;
    if (actual.isMember("error")) codes_seen_.insert(actual["error"]["code"].asString());
    is_answered_ = actual.isMember("success");
  }

  void Send(const std::string& request) {
    is_answered_ = false;
    if (std::exchange(is_ending_next_, false)) return SendWhileItEnds(request);
    ASSERT_TRUE(client_->Send(request));
  }

  void SendWhileItEnds(const std::string& request) {
    const auto header = quordaemon::EncodeHeader(static_cast<uint32_t>(request.size()));
    const std::string bytes = std::string(header.begin(), header.end()) + request;
    ASSERT_EQ(send(client_->descriptor(), bytes.data(), 10, MSG_NOSIGNAL), 10);
    DaemonClient(daemon_->socket()).Ask(R"({"command":"status"})");
    daemon_->Signal(SIGTERM);
    while (daemon_->Notifications().size() < 2) std::this_thread::sleep_for(std::chrono::milliseconds(5));
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    ASSERT_GT(send(client_->descriptor(), bytes.data() + 10, bytes.size() - 10, MSG_NOSIGNAL), 0);
  }

  void SendMoreThanFits() {
    Start();
    // A thread that asks for memory for the first time takes 64 MiB of addresses. There has to be room for the text
    // all the same, and for no more than that.
    std::ifstream file("/proc/" + std::to_string(daemon_->pid()) + "/statm");
    rlim_t pages = 0;
    file >> pages;
    const rlim_t most = pages * 4096 + (rlim_t{256} << 20);
    const rlimit limit{most, most};
    ASSERT_EQ(prlimit(daemon_->pid(), RLIMIT_AS, &limit, nullptr), 0);
    ASSERT_TRUE(
        client_->Send(R"({"command":"status","request_id":"a","data":)" + EmptyArrays(1900000) + "}"));
  }

  // An array of so many values, itself counted.
  static std::string EmptyArrays(int values) {
    std::string text = "[[]";
    for (int i = 2; i < values; ++i) text += ",[]";
    return text + "]";
  }

  std::string CompoundFile() const { return Path(FindFile(Path(""), ".cfs")); }

  // What lines that begin with # do.
  void Act(const std::string& what) {
    const std::map<std::string, std::function<void()>> actions = {
        {"another process writes to the index books",
         [this] {
           Start();
           other_process_.emplace(Path(""));
         }},
        {"the other process is done", [this] { other_process_.reset(); }},
        {"the commit of the index books is overwritten",
         [this] {
           daemon_->Stop();
           for (const std::string& name : ListFolder(Path(""))) {
             if (name.starts_with("segments_")) WriteFile(Path(name), "something else");
           }
           Start();
         }},
        {"on the disk, a stored title of the index books becomes Nblomov",
         [this] {
           whole_file_ = ReadFile(CompoundFile());
           std::string changed = whole_file_;
           changed.at(changed.find("Oblomov")) = 'N';
           WriteFile(CompoundFile(), changed);
         }},
        {"it is Oblomov again", [this] { WriteFile(CompoundFile(), whole_file_); }},
        {"a file of the index books is cut off",
         [this] {
           whole_file_ = ReadFile(CompoundFile());
           WriteFile(CompoundFile(), whole_file_.substr(0, whole_file_.size() / 2));
         }},
        {"that file is made whole again", [this] { WriteFile(CompoundFile(), whole_file_); }},
        {"the settings of the index notes are removed",
         [this] { fs::remove(daemon_->data() + "/notes/quorelastic.json"); }},
        {"the daemon is started with the plugin pause and a search timeout of 50 milliseconds",
         [this] {
           fs::create_directory(folder_ / "plugins");
           fs::copy_file(PAUSE_PLUGIN, folder_ / "plugins/pause.so");
           fs::permissions(folder_ / "plugins/pause.so", fs::perms::owner_all);
           Start({"--plugins", folder_ / "plugins", "--search-timeout", "0.05"});
         }},
        {"the daemon is told to end while the next request is on its way",
         [this] { is_ending_next_ = true; }},
        {"a client announces a message of 64 MiB and a byte",
         [this] {
           Start();
           const auto header = quordaemon::EncodeHeader(quordaemon::kLongestMessage + 1);
           ASSERT_EQ(send(client_->descriptor(), header.data(), header.size(), MSG_NOSIGNAL), 4);
         }},
        {"a request of the command status with 1,900,000 values, and a daemon that gets no more than 256 MiB",
         [this] { SendMoreThanFits(); }},
        {"a client sends a request of the command document_delete with 2000001 values",
         [this] {
           Start();
           const std::string values = EmptyArrays(2000001 - 3);  // and three around them
           ASSERT_TRUE(
               client_->Send(R"({"command":"document_delete","request_id":"b","data":)" + values + "}"));
         }},
    };
    const auto found = actions.find(what);
    ASSERT_NE(found, actions.end()) << "nobody knows how to do this: " << what;
    found->second();
  }

  void Replay(const ProtocolDocument::Transcript& transcript) {
    for (const std::string& line : transcript.lines) {
      ASSERT_GT(line.size(), 2u);
      const std::string rest = line.substr(2);
      switch (line.front()) {
        case '#':
          if (kIsSanitized && rest.find("256 MiB") != std::string::npos) {
            std::cout << "left out: a sanitizer ends the process when memory runs out" << std::endl;
            codes_seen_.insert("internal");
            return;
          }
          Act(rest);
          break;
        case '>':
          EXPECT_TRUE(is_answered_) << "a request before the last one's final reply";
          Send(rest);
          break;
        case '<':
          Expect(rest);
          break;
        default:
          FAIL() << "neither a request nor a reply: " << line;
      }
      if (HasFatalFailure()) return;
    }
    EXPECT_TRUE(is_answered_) << "the last request's final reply is missing";
  }

  const ProtocolDocument document_ = ReadProtocolDocument();
  TemporaryFolder folder_;
  std::unique_ptr<DaemonProcess> daemon_;
  std::unique_ptr<DaemonClient> client_;
  std::optional<vantrel::elastic::WriteLock> other_process_;
  std::string whole_file_;  // before it was damaged
  bool is_ending_next_ = false;
  bool is_answered_ = true;
  std::set<std::string> codes_seen_;
};

TEST_F(ProtocolTranscripts, AreWhatADaemonSays) {
  ASSERT_GT(document_.transcripts.size(), 10u);
  Start();
  for (const auto& transcript : document_.transcripts) {
    SCOPED_TRACE("docs/protocol.md:" + std::to_string(transcript.line));
    Replay(transcript);
    if (HasFatalFailure()) return;
  }
  for (const quorelasticd::ErrorEntry& entry : quorelasticd::kErrorTable) {
    EXPECT_TRUE(codes_seen_.contains(entry.text)) << entry.text;
  }
}

}  // namespace
}  // namespace quorelastic::testing
