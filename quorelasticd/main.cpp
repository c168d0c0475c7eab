// quorelasticd: serves the full-text indexes of one data folder on a Unix domain socket.

#include <spdlog/spdlog.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <systemd/sd-daemon.h>

#include <boost/asio/thread_pool.hpp>
#include <chrono>
#include <csignal>
#include <cstdint>
#include <exception>
#include <iostream>
#include <optional>
#include <string>

#include "base/limits.h"
#include "commands/command_service.h"
#include "commands/daemon.h"
#include "data_root/data_root.h"
#include "data_root/index_registry.h"
#include "health/repair_worker.h"
#include "logging.h"
#include "options.h"
#include "server/listener.h"
#include "server/server.h"
#include "shutdown_watch.h"
#include "vantrel/elastic/library_setup.h"
#include "vantrel/elastic/search_plugin.h"
#include "version.h"

namespace {

using namespace quorelasticd;

constexpr int kFailure = 1;
constexpr int kBadCommandLine = 2;

// For what is cut off at the end to come to its own.
constexpr std::chrono::seconds kGrace{5};

ServerLimits LimitsOf(const Options& options) {
  ServerLimits limits;
  limits.threads = static_cast<size_t>(options.threads);
  limits.connections = static_cast<size_t>(options.max_connections);
  limits.timeouts.idle = std::chrono::seconds(options.idle_timeout);
  limits.timeouts.stalled = std::chrono::seconds(options.stall_timeout);
  limits.shutdown = std::chrono::seconds(options.shutdown_timeout);
  return limits;
}

std::chrono::milliseconds SearchTimeLimit(const Options& options) {
  return std::chrono::ceil<std::chrono::milliseconds>(std::chrono::duration<double>(options.search_timeout));
}

void TellReady(const std::string& socket) {
  spdlog::info("quorelasticd {} serves on {}", kVersion, socket);
  sd_notifyf(0, "READY=1\nSTATUS=Serving on %s", socket.c_str());
}

// Where the service manager wants to be told, it ends a daemon that does not tell.
void TellAlive(Server& server) {
  uint64_t most = 0;  // microseconds between two times
  if (sd_watchdog_enabled(0, &most) <= 0) return;
  server.BeatEvery(std::chrono::microseconds(most / 3), [] { sd_notify(0, "WATCHDOG=1"); });
}

void TellStopping() { sd_notify(0, "STOPPING=1\nSTATUS=Finishing what is running"); }

// An index takes several descriptors; the usual soft limit is there for programs that cannot count beyond it.
void RaiseDescriptorLimit() {
  rlimit limit{};
  if (getrlimit(RLIMIT_NOFILE, &limit) != 0) return;
  limit.rlim_cur = limit.rlim_max;
  setrlimit(RLIMIT_NOFILE, &limit);
}

int Serve(const Options& options) {
  const DataRoot root(options.data);
  Listener listener(options.socket);
  vantrel::elastic::SearchPluginRegistry plugins;
  if (!options.plugins.empty()) {
    spdlog::info("{}: {} search plugins", options.plugins, plugins.LoadFolder(options.plugins));
  }
  const auto threads = static_cast<size_t>(options.threads);
  Turns quick_searches(static_cast<int>(options.threads) - 1);
  boost::asio::thread_pool search_threads(threads);
  boost::asio::thread_pool slow_threads(threads);
  IndexRegistry registry(root, slow_threads.get_executor(), static_cast<size_t>(options.max_open_indexes));
  Statistics statistics;
  Turns health_turns(kMostHealthRuns);
  boost::asio::thread_pool health_threads(kMostHealthRuns);
  const Daemon daemon(registry, statistics,
                      {plugins, quick_searches, search_threads.get_executor(), SearchTimeLimit(options)},
                      {health_turns, health_threads.get_executor()});
  CommandService service(daemon);
  Server server(listener.Release(), service, LimitsOf(options), statistics.connections);
  ShutdownWatch watch(std::chrono::seconds(options.shutdown_timeout) + kGrace);
  TellAlive(server);
  TellReady(listener.path());
  server.Run([&] {
    TellStopping();
    watch.Start();
  });
  search_threads.join();
  health_threads.join();
  slow_threads.join();
  const bool is_committed = registry.CommitAll();
  watch.Stop();
  spdlog::info("ended");
  return is_committed ? 0 : kFailure;
}

}  // namespace

int main(int argc, char** argv) {
  if (const std::optional<int> status = RunAsRepairWorker(argc, argv)) return *status;
  std::optional<Options> options;
  try {
    std::string text;
    options = ParseOptions(argc, argv, text);
    if (!options.has_value()) {
      std::cout << text << std::flush;
      return std::cout.good() ? 0 : kFailure;
    }
  } catch (const OptionError& error) {
    std::cerr << "quorelasticd: " << error.what() << std::endl;
    return kBadCommandLine;
  }
  try {
    StartLogging(options->log_level);
    std::signal(SIGPIPE, SIG_IGN);
    umask(S_IWGRP | S_IRWXO);
    RaiseDescriptorLimit();
    vantrel::elastic::PrepareIndexLibrary();
    return Serve(*options);
  } catch (const std::exception& error) {
    spdlog::critical("{}", error.what());
    return kFailure;
  }
}
