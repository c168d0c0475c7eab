// The daemon and the actions that talk to it against their peers, whole processes, as ratios in one run.

#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "quordaemon/domain_sock_connection.h"
#include "support/background_process.h"
#include "support/figures.h"
#include "support/run_benchmark.h"
#include "support/timed_run.h"
#include "support/wordnet_queries.h"
#include "vantrel/elastic/json_value.h"

namespace {

using quorelastic::bench::BackgroundProcess;
using quorelastic::bench::Compare;
using quorelastic::bench::Figures;
using quorelastic::bench::MakeWordnetQueries;
using quorelastic::bench::RunIntoFile;

namespace fs = std::filesystem;

constexpr int kSynsets = 117659;
constexpr size_t kQueries = 8000;
constexpr size_t kReplyBytes = size_t{64} << 20;

class DaemonBench {
 public:
  explicit DaemonBench(const std::string& folder) : folder_(folder) {
    fs::create_directories(folder_ + "/run");
    fs::create_directories(folder_ + "/data/import");
    RunIntoFile({QUORELASTIC_WORDNET_DOCUMENTS}, folder_ + "/data/import/wordnet.ndjson");
  }

  bool Measure() {
    {
      const BackgroundProcess daemon(
          {QUORELASTIC_DAEMON, "--socket", Socket(), "--data", folder_ + "/data", "--log-level", "warning"},
          Socket());
      MeasureExchange();
      MeasureLoad();
      MeasureSearches();
    }
    MeasureReplies();
    return figures_.all_met();
  }

 private:
  std::string Socket() const { return folder_ + "/run/quorelasticd.sock"; }

  // The tool where /run is the folder of the socket.
  std::vector<std::string> Tool(const std::vector<std::string>& arguments) const {
    std::vector<std::string> command{"/usr/bin/bwrap", "--ro-bind",     "/",      "/",
                                     "--dev",          "/dev",          "--bind", folder_ + "/run",
                                     "/run",           QUORELASTIC_TOOL};
    command.insert(command.end(), arguments.begin(), arguments.end());
    return command;
  }

  void MeasureExchange() {
    figures_.AddDifference(
        "one small exchange, against a run that does nothing",
        Compare(Tool({"-a", "command", "--string", R"({"command":"status"})"}), Tool({"-a", "plugin"}), 201),
        1.0);
  }

  void MeasureLoad() {
    Write("create.json",
          R"({"command":"index_create","data":{"id":"wordnet","settings":{"fields":[
             {"name":"id","type":"keyword","norms":false,"frequencies":false},
             {"name":"pos","type":"keyword","norms":false,"frequencies":false},
             {"name":"lemma","type":"text","term_vector":"positions"},
             {"name":"gloss","type":"text","term_vector":"positions_offsets"}]}}})");
    Write("delete.json", R"({"command":"index_delete","data":{"id":"wordnet","confirm":"wordnet"}})");
    Write("load.json", R"({"command":"document_bulk","data":{"id":"wordnet","file":"wordnet.ndjson"}})");
    std::string script;
    for (const char* request : {"delete", "create", "load"}) {
      for (const std::string& word :
           Tool({"-a", "command", "--path", folder_ + "/run/" + std::string(request) + ".json"})) {
        script += "'" + word + "' ";
      }
      script += "\n";
    }
    Write("load.sh", script);
    const std::string library = folder_ + "/library";
    Write("library.sh",
          "rm -rf '" + library + "' && exec '" QUORELASTIC_PEER_LIBRARY_LOAD "' '" + library + "'");
    figures_.AddThroughput(
        "bulk load of WordNet, against the library's own writer",
        Compare({"/bin/sh", folder_ + "/run/load.sh"}, {"/bin/sh", folder_ + "/run/library.sh"}, 5), 0.8);
    CheckLoaded();
  }

  // The tool's status does not tell.
  void CheckLoaded() const {
    quordaemon::DomainSockConnection connection(Socket());
    std::string reply;
    if (!connection.Connect() || !connection.Send(R"({"command":"optimize","data":{"id":"wordnet"}})") ||
        !connection.Recv(reply)) {
      throw std::runtime_error("the daemon does not answer");
    }
    vantrel::elastic::JsonValue json;
    if (!json.fromString(reply) || json["result"]["documents"] != kSynsets) {
      throw std::runtime_error("the load went wrong: " + reply);
    }
  }

  void MeasureSearches() {
    const std::string queries = folder_ + "/queries";
    std::ofstream file(queries);
    for (const std::string& query : MakeWordnetQueries(kQueries)) file << query << '\n';
    file.close();
    for (const char* clients : {"1", "2", "16"}) {
      figures_.AddThroughput(
          std::string("searches through the socket, against the library in-process: clients or threads: ") +
              clients,
          Compare({QUORELASTIC_ASK_SEARCHES, Socket(), queries, clients},
                  {QUORELASTIC_PEER_LIBRARY_SEARCHES, folder_ + "/data/wordnet", queries, clients}, 7),
          0.8);
    }
  }

  void MeasureReplies() {
    figures_.AddRatio("64 MiB of replies of 1 KiB, against parsing them", CompareReplies(1024), 2.0);
    figures_.AddInformation("64 MiB of replies of 100 bytes, against parsing them", CompareReplies(100));
  }

  quorelastic::bench::Comparison CompareReplies(size_t size) {
    const std::string replies = folder_ + "/replies";
    std::ofstream file(replies);
    for (size_t bytes = 0; bytes < kReplyBytes; bytes += size) {
      file << MakeReply(bytes, size) << '\n';
    }
    file << R"({"success":true})" << '\n';
    file.close();
    fs::remove(Socket());
    const BackgroundProcess server({QUORELASTIC_SERVE_REPLIES, Socket(), replies}, Socket());
    return Compare(Tool({"-a", "command", "--string", "{}"}), {QUORELASTIC_PEER_PARSE_LINES, replies}, 7);
  }

  // A progress reply of this size at least, with terms as far as there is room.
  static std::string MakeReply(size_t number, size_t size) {
    std::string reply = R"({"command":"terms","progress":{"terms":[{"field":"gloss","text":"t)" +
                        std::to_string(number) + R"("})";
    while (reply.size() + 40 < size) reply += R"(,{"field":"gloss","text":"telescope"})";
    return reply + "]}}";
  }

  void Write(const std::string& name, const std::string& text) const {
    std::ofstream file(folder_ + "/run/" + name);
    file << text;
    if (!file.flush()) throw std::runtime_error("cannot write " + name);
  }

  std::string folder_;
  Figures figures_;
};

}  // namespace

int main() {
  return quorelastic::bench::RunBenchmark(
      [](const std::string& folder) { return DaemonBench(folder).Measure(); });
}
