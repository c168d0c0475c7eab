#include "health/repair_worker.h"

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <iostream>
#include <string_view>
#include <system_error>

#include "errors/request_error.h"
#include "vantrel/elastic/index_repair.h"
#include "vantrel/elastic/json_value.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::JsonValue;

// No option: administrators have no use for it.
constexpr std::string_view kWorkerWord = "--repair-worker";
constexpr const char* kDryRun = "dry";
constexpr const char* kRealRun = "real";

[[noreturn]] void Fail(int error, const char* what) {
  throw std::system_error(error, std::generic_category(), what);
}

// How the process is to be started.
class SpawnSettings {
 public:
  explicit SpawnSettings(int output) {
    Require(posix_spawn_file_actions_init(&actions_));
    Require(posix_spawn_file_actions_addopen(&actions_, STDIN_FILENO, "/dev/null", O_RDONLY, 0));
    Require(posix_spawn_file_actions_adddup2(&actions_, output, STDOUT_FILENO));
    // A group of its own, so that its children end with it; and the signals that this daemon ignores are back.
    Require(posix_spawnattr_init(&attributes_));
    Require(posix_spawnattr_setpgroup(&attributes_, 0));
    sigset_t signals;
    sigemptyset(&signals);
    Require(posix_spawnattr_setsigmask(&attributes_, &signals));
    sigaddset(&signals, SIGPIPE);
    Require(posix_spawnattr_setsigdefault(&attributes_, &signals));
    Require(posix_spawnattr_setflags(&attributes_,
                                     POSIX_SPAWN_SETPGROUP | POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF));
  }
  SpawnSettings(const SpawnSettings&) = delete;
  SpawnSettings& operator=(const SpawnSettings&) = delete;
  ~SpawnSettings() {
    posix_spawn_file_actions_destroy(&actions_);
    posix_spawnattr_destroy(&attributes_);
  }

  pid_t Spawn(std::array<std::string, 4> arguments) const {
    std::array<char*, 5> pointers{};
    std::transform(arguments.begin(), arguments.end(), pointers.begin(),
                   [](std::string& word) { return word.data(); });
    pid_t process = -1;
    // Not by its name: the file may have been replaced since, by another version.
    const int error =
        posix_spawn(&process, "/proc/self/exe", &actions_, &attributes_, pointers.data(), environ);
    if (error != 0) Fail(error, "cannot start a process for the repair");
    return process;
  }

 private:
  static void Require(int error) {
    if (error != 0) Fail(error, "cannot prepare a process for the repair");
  }

  posix_spawn_file_actions_t actions_{};
  posix_spawnattr_t attributes_{};
};

JsonValue ToJson(const vantrel::elastic::RepairReport& report) {
  JsonValue json(Json::objectValue);
  json["generation"] = static_cast<Json::Int64>(report.generation);
  json["clean"] = report.is_clean;
  json["lost"] = Json::Value(Json::arrayValue);
  for (const auto& loss : report.losses) {
    Json::Value& entry = json["lost"].append(Json::objectValue);
    entry["segment"] = loss.segment;
    entry["documents"] = static_cast<Json::UInt64>(loss.documents);
    entry["condemned"] = loss.is_condemned;
  }
  return json;
}

RequestError ToError(const Json::Value& error) {
  const std::string code = error["code"].asString();
  const auto* entry = std::find_if(kErrorTable.begin(), kErrorTable.end(),
                                   [&](const ErrorEntry& candidate) { return candidate.text == code; });
  return {entry == kErrorTable.end() ? ErrorCode::kInternal : entry->code, error["reason"].asString()};
}

}  // namespace

RepairWorker::RepairWorker(const std::string& index_path, bool is_dry_run) {
  std::array<int, 2> ends{};
  if (pipe2(ends.data(), O_CLOEXEC) != 0) Fail(errno, "cannot create a pipe for the repair");
  output_ = vantrel::elastic::FileDescriptor(ends[0]);
  const vantrel::elastic::FileDescriptor input(ends[1]);
  const SpawnSettings settings(input.get());
  process_ =
      settings.Spawn({"quorelasticd", std::string(kWorkerWord), is_dry_run ? kDryRun : kRealRun, index_path});
}

RepairWorker::~RepairWorker() {
  if (process_ < 0) return;
  kill(-process_, SIGKILL);
  WaitForExit();
}

std::optional<Json::Value> RepairWorker::WaitFor(std::chrono::milliseconds most) {
  if (ReadSome(most)) return std::nullopt;
  const int status = WaitForExit();
  JsonValue answer;
  if (WIFSIGNALED(status)) {
    throw RequestError(ErrorCode::kInternal,
                       "the process of the repair was ended by signal " + std::to_string(WTERMSIG(status)));
  }
  if (status != 0 || !answer.fromString(text_) || !answer.isObject()) {
    throw RequestError(ErrorCode::kInternal, "the process of the repair ended without a report");
  }
  if (answer.isMember("error")) throw ToError(answer["error"]);
  return answer;
}

// False at the end of what the process writes.
bool RepairWorker::ReadSome(std::chrono::milliseconds most) {
  pollfd waited{.fd = output_.get(), .events = POLLIN, .revents = 0};
  const int ready = poll(&waited, 1, static_cast<int>(most.count()));
  if (ready == 0 || (ready < 0 && errno == EINTR)) return true;
  std::array<char, 4096> buffer{};
  const ssize_t got = read(output_.get(), buffer.data(), buffer.size());
  if (got < 0 && errno == EINTR) return true;
  if (got < 0) Fail(errno, "cannot read what the repair says");
  text_.append(buffer.data(), static_cast<size_t>(got));
  return got > 0;
}

int RepairWorker::WaitForExit() {
  int status = 0;
  while (waitpid(process_, &status, 0) < 0 && errno == EINTR) {
  }
  process_ = -1;
  return status;
}

namespace {

JsonValue Answer(const std::string& path, bool is_dry_run) {
  try {
    return ToJson(is_dry_run ? vantrel::elastic::PlanRepair(path) : vantrel::elastic::RepairIndex(path));
  } catch (...) {
    JsonValue failure(Json::objectValue);
    failure["error"] = ToRequestError().ToJson();
    return failure;
  }
}

}  // namespace

std::optional<int> RunAsRepairWorker(int argc, const char* const* argv) {
  if (argc != 4 || argv[1] != kWorkerWord) return std::nullopt;
  std::cout << Answer(argv[3], argv[2] == std::string_view(kDryRun)).toString() << std::flush;
  return std::cout.good() ? 0 : 1;
}

}  // namespace quorelasticd
