#include "logging.h"

#include <spdlog/pattern_formatter.h>
#include <spdlog/sinks/stdout_sinks.h>
#include <spdlog/spdlog.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <memory>
#include <string_view>
#include <utility>

namespace quorelasticd {
namespace {

// Whether standard error is what the service manager connected to the journal, and not redirected since.
bool GoesToJournal() {
  const char* stream = std::getenv("JOURNAL_STREAM");
  struct stat status {};
  if (stream == nullptr || fstat(STDERR_FILENO, &status) != 0) return false;
  return std::to_string(status.st_dev) + ":" + std::to_string(status.st_ino) == stream;
}

// "<6>": the priority that the journal takes off a line's beginning.
class JournalPriority : public spdlog::custom_flag_formatter {
 public:
  void format(const spdlog::details::log_msg& message, const std::tm& /*time*/,
              spdlog::memory_buf_t& line) override {
    const std::string_view text = Priority(message.level);
    line.append(text.data(), text.data() + text.size());
  }

  std::unique_ptr<custom_flag_formatter> clone() const override {
    return std::make_unique<JournalPriority>();
  }

 private:
  static std::string_view Priority(spdlog::level::level_enum level) {
    switch (level) {
      case spdlog::level::critical:
        return "<2>";
      case spdlog::level::err:
        return "<3>";
      case spdlog::level::warn:
        return "<4>";
      case spdlog::level::info:
        return "<6>";
      default:
        return "<7>";
    }
  }
};

}  // namespace

void StartLogging(const std::string& level) {
  auto logger =
      std::make_shared<spdlog::logger>("quorelasticd", std::make_shared<spdlog::sinks::stderr_sink_mt>());
  logger->set_level(spdlog::level::from_str(level));
  logger->flush_on(spdlog::level::trace);
  if (GoesToJournal()) {
    auto formatter = std::make_unique<spdlog::pattern_formatter>();
    formatter->add_flag<JournalPriority>('*').set_pattern("%*%v");
    logger->set_formatter(std::move(formatter));
  } else {
    logger->set_pattern("%Y-%m-%dT%H:%M:%S.%e%z %l: %v");
  }
  spdlog::set_default_logger(std::move(logger));
}

}  // namespace quorelasticd
