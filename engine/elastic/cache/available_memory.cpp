#include "elastic/cache/available_memory.h"

#include <algorithm>
#include <charconv>
#include <fstream>
#include <limits>
#include <optional>
#include <string_view>

namespace vantrel::elastic {
namespace {

constexpr uint64_t kUnlimited = std::numeric_limits<uint64_t>::max();

// The two layouts of control groups. Both may be mounted; a process has its memory counted by one of them.
struct ControlGroupLayout {
  std::string_view line_start;  // in /proc/self/cgroup, after the hierarchy's number
  const char* mount;
  const char* limit_file;
  const char* usage_file;
  // In memory.stat: the part of the usage that is page cache, and the part of that which is shared memory or files
  // of a memory file system. No disk holds these: the kernel cannot throw them out.
  const char* cache_statistic;
  const char* shared_statistic;
};

constexpr ControlGroupLayout kLayouts[] = {
    {"::", "/sys/fs/cgroup", "/memory.max", "/memory.current", "file", "shmem"},
    {":memory:", "/sys/fs/cgroup/memory", "/memory.limit_in_bytes", "/memory.usage_in_bytes", "total_cache",
     "total_shmem"}};

std::optional<uint64_t> ParseDecimal(std::string_view text) {
  text.remove_prefix(std::min(text.find_first_not_of(" \t"), text.size()));
  uint64_t number = 0;
  const auto [behind, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error != std::errc() || behind == text.data()) return std::nullopt;
  return number;
}

std::optional<uint64_t> ReadNumber(const std::string& path) {
  std::ifstream file(path);
  std::string line;
  std::getline(file, line);
  return ParseDecimal(line);
}

// The number behind `name` at the start of a line.
std::optional<uint64_t> ReadStatistic(const std::string& path, std::string_view name) {
  std::ifstream file(path);
  for (std::string line; std::getline(file, line);) {
    if (line.starts_with(name) && line.size() > name.size() && line[name.size()] == ' ') {
      return ParseDecimal(std::string_view(line).substr(name.size()));
    }
  }
  return std::nullopt;
}

uint64_t AvailableInGroup(const std::string& folder, const ControlGroupLayout& layout) {
  const auto limit = ReadNumber(folder + layout.limit_file);
  const auto usage = ReadNumber(folder + layout.usage_file);
  if (!limit.has_value() || !usage.has_value()) return kUnlimited;
  const uint64_t cache = ReadStatistic(folder + "/memory.stat", layout.cache_statistic).value_or(0);
  const uint64_t shared = ReadStatistic(folder + "/memory.stat", layout.shared_statistic).value_or(0);
  const uint64_t can_go = cache - std::min(shared, cache);
  const uint64_t in_use = *usage - std::min(can_go, *usage);
  return *limit - std::min(in_use, *limit);
}

// A group is also bound by those above it.
uint64_t AvailableInGroups(const std::string& mount, std::string group, const ControlGroupLayout& layout) {
  uint64_t least = kUnlimited;
  for (;;) {
    least = std::min(least, AvailableInGroup(mount + group, layout));
    const size_t slash = group.rfind('/');
    if (slash == std::string::npos) return least;
    group.resize(slash);
  }
}

// The kernel's estimate leaves out shared memory by itself.
uint64_t AvailableOnMachine(const std::string& system_root) {
  constexpr uint64_t kKibibyte = 1024;
  const auto available = ReadStatistic(system_root + "/proc/meminfo", "MemAvailable:");
  return available.has_value() ? *available * kKibibyte : kUnlimited;
}

}  // namespace

uint64_t AvailableMemory(const std::string& system_root) {
  uint64_t least = AvailableOnMachine(system_root);
  std::ifstream groups(system_root + "/proc/self/cgroup");
  for (std::string line; std::getline(groups, line);) {
    const size_t colon = std::min(line.find(':'), line.size());
    const std::string_view rest = std::string_view(line).substr(colon);
    for (const ControlGroupLayout& layout : kLayouts) {
      if (!rest.starts_with(layout.line_start)) continue;
      const auto group = std::string(rest.substr(layout.line_start.size()));
      least = std::min(least, AvailableInGroups(system_root + layout.mount, group, layout));
    }
  }
  return least;
}

}  // namespace vantrel::elastic
