// The daemon at work under the confinement of its unit, as far as that can be had without systemd: the unit's system
// calls alone, no memory that is both written and executed, a file system that is read-only but for the state folder,
// no network, no capability, the socket handed over.

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <memory>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "daemon_client.h"
#include "packaging/command_output.h"
#include "support/byte_writer.h"
#include "support/descriptor.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "support/text_search.h"
#include "vantrel/elastic/index.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::HasSubstr;

// The calls of a group, those of the groups within included; of a call, itself.
void Expand(const std::string& name, std::set<std::string>& calls) {
  if (!name.starts_with("@")) {
    calls.insert(name);
    return;
  }
  for (const std::string& line : SplitLines(OutputOf({"systemd-analyze", "syscall-filter", name}))) {
    const size_t begin = line.find_first_not_of(' ');
    if (begin == 0 || begin == std::string::npos || line[begin] == '#') continue;
    Expand(line.substr(begin), calls);
  }
}

// What the unit's SystemCallFilter= lines come to: lists of what is allowed, and behind a ~ of what is not.
std::set<std::string> AllowedCalls(const std::string& unit) {
  const std::string key = "SystemCallFilter=";
  std::set<std::string> allowed;
  Expand("@default", allowed);
  for (const std::string& line : SplitLines(ReadFile(unit))) {
    if (!line.starts_with(key)) continue;
    const bool is_refusal = line[key.size()] == '~';
    std::set<std::string> named;
    std::istringstream words(line.substr(key.size() + (is_refusal ? 1 : 0)));
    for (std::string word; words >> word;) Expand(word, named);
    for (const std::string& call : named) is_refusal ? void(allowed.erase(call)) : void(allowed.insert(call));
  }
  return allowed;
}

Descriptor Listen(const std::string& path) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  path.copy(address.sun_path, sizeof address.sun_path - 1);
  Descriptor sock(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  if (bind(sock.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
      listen(sock.get(), 8) != 0) {
    throw std::runtime_error("cannot listen on " + path);
  }
  return sock;
}

class ConfinedService : public ::testing::Test {
 protected:
  void SetUp() override {
    const RunResult trial = RunCommand({"bwrap", "--ro-bind", "/", "/", "--unshare-net", "true"});
    if (trial.status != 0) GTEST_SKIP() << "no sandbox on this machine: " << trial.err;
    std::string calls;
    for (const std::string& call : AllowedCalls(SERVICE_UNIT)) calls += call + "\n";
    WriteFile(folder_ / "calls", calls);
    fs::create_directory(data_);
  }

  std::vector<std::string> Confined(const std::vector<std::string>& command) const {
    std::vector<std::string> all{
        "bwrap",         "--die-with-parent", "--ro-bind", "/",      "/",   "--dev", "/dev",
        "--unshare-net", "--cap-drop",        "ALL",       "--bind", data_, data_,   "--"};
    // Standard input becomes the socket that a service manager hands over. The process id stays.
    const std::string script = "echo $$; exec 3<&0 </dev/null; LISTEN_FDS=1 LISTEN_PID=$$ exec \"$@\"";
    for (const std::string& word : {std::string("sh"), std::string("-c"), script, std::string("sh"),
                                    std::string(CONFINE_PROGRAM), folder_ / "calls"}) {
      all.push_back(word);
    }
    all.insert(all.end(), command.begin(), command.end());
    return all;
  }

  void StartDaemon() {
    const Descriptor listener = Listen(folder_ / "socket");
    daemon_ = std::make_unique<Process>(
        Confined({std::string(BUILD_FOLDER) + "/bin/quorelasticd", "--data", data_}),
        RunOptions{.input_descriptor = listener.get()});
  }

  JsonValue Ask(const std::string& request) {
    JsonValue reply = DaemonClient(folder_ / "socket").Ask(request);
    EXPECT_TRUE(reply["success"].asBool()) << request << "\n" << reply.toString() << "\n" << daemon_->Err();
    return reply;
  }

  TemporaryFolder folder_;
  std::string data_ = folder_ / "data";
  std::unique_ptr<Process> daemon_;
};

TEST_F(ConfinedService, TheConfinementHolds) {
  const auto outcome = [&](const std::vector<std::string>& command) {
    const RunResult run = RunCommand(Confined(command));
    return run.out + run.err;
  };
  EXPECT_THAT(outcome({FORBIDDEN_PROGRAM, "memory"}), HasSubstr("Operation not permitted\n"));
  EXPECT_THAT(outcome({FORBIDDEN_PROGRAM, "network"}),
              HasSubstr("Address family not supported by protocol\n"));
  // Whoever owns a file may give it to himself; but for that, the call is not on the list.
  EXPECT_THAT(outcome({"/usr/bin/chown", std::to_string(geteuid()), data_}),
              HasSubstr("Operation not permitted"));
  EXPECT_THAT(outcome({"/usr/bin/touch", folder_ / "file"}), HasSubstr("Read-only file system"));
  EXPECT_EQ(RunCommand(Confined({"/usr/bin/touch", data_ + "/file"})).status, 0);
}

TEST_F(ConfinedService, TheDaemonLoadsSearchesAndEndsInOrder) {
  StartDaemon();
  Ask(R"({"command":"index_create","data":{"id":"x","settings":{"fields":[)"
      R"({"name":"t","type":"text","pre_processors":[{"name":"tolower"}]}]}}})");
  WriteFile(data_ + "/import/more.ndjson", "{\"id\":\"2\",\"t\":\"the sea\"}\n");
  Ask(R"({"command":"document_bulk","data":{"id":"x","documents":[{"id":"1","t":"The Sea"}],"commit":true}})");
  Ask(R"({"command":"document_bulk","data":{"id":"x","file":"more.ndjson","commit":true}})");
  Ask(R"({"command":"optimize","data":{"id":"x"}})");
  EXPECT_EQ(
      Ask(R"({"command":"search","data":{"indice":["x"],"query_string":{"query":"se*"}}})")["result"]["total"]
          .asInt(),
      2);
  Ask(R"({"command":"check","data":{"id":"x"}})");
  Ask(R"({"command":"index_delete","data":{"id":"x","confirm":"x"}})");
  kill(std::stoi(daemon_->Out()), SIGTERM);
  const RunResult run = daemon_->Wait();
  EXPECT_EQ(run.status, 0) << run;
}

TEST_F(ConfinedService, TheProcessOfARepairRunsToo) {
  {
    const auto index =
        vantrel::elastic::Index::Create(data_ + "/x", {.fields = {{.name = "t"}}, .compound_files = false});
    for (const char* id : {"1", "2"}) {
      index->Add({{{"id", id}, {"t", "a word"}}});
      index->Commit();
    }
  }
  // The index library divides by this, so that a child tries what it would do.
  const std::string file = data_ + "/x/_1.tis";
  WriteFile(file, ReadFile(file).replace(12, 4, ByteWriter().Int(0).bytes()));
  StartDaemon();
  const JsonValue reply = Ask(R"({"command":"repair","data":{"id":"x","dry_run":false}})");
  ASSERT_EQ(reply["result"]["lost"].size(), 1U) << reply.toString();
  EXPECT_TRUE(reply["result"]["lost"][0]["condemned"].asBool());
  EXPECT_EQ(
      Ask(R"({"command":"search","data":{"indice":["x"],"query_string":{"query":"word"}}})")["result"]
                                                                                            ["total"]
                                                                                                .asInt(),
      1);
}

}  // namespace
}  // namespace quorelastic::testing
