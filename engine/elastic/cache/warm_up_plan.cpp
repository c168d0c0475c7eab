#include "elastic/cache/warm_up_plan.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <filesystem>
#include <iterator>
#include <string_view>
#include <system_error>
#include <utility>

#include "elastic/common/path.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/folder.h"
#include "elastic/format/segment/compound_file.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

// What searches need, first to last; everything else comes after it.
constexpr std::array<std::string_view, 5> kFirst = {".tii", ".tis", ".nrm", ".frq", ".prx"};
constexpr size_t kRanks = kFirst.size() + 1;

using Ranked = std::array<std::vector<Extent>, kRanks>;

size_t RankOf(std::string_view name) {
  const auto first = std::find_if(kFirst.begin(), kFirst.end(),
                                  [&](std::string_view ending) { return name.ends_with(ending); });
  return static_cast<size_t>(first - kFirst.begin());
}

// The parts of a compound file, each by what it is; false where its table cannot be read.
bool PlanParts(const format::DiskFolder& folder, const std::string& name, Ranked& plan) {
  try {
    const auto source = folder.Open(name);
    const format::CompoundFile compound(source);
    plan[0].push_back({source->name(), 0, compound.first_offset()});  // the table
    for (const auto& [part_name, part] : compound.parts()) {
      plan[RankOf(part_name)].push_back({source->name(), part.offset, part.size});
    }
    return true;
  } catch (const IndexError&) {
    return false;
  }
}

void PlanFile(const format::DiskFolder& folder, const std::string& name, Ranked& plan) {
  if (name.ends_with(".cfs") && PlanParts(folder, name, plan)) return;
  const std::string path = JoinPath(folder.path(), name);
  std::error_code error;
  const uint64_t size = std::filesystem::file_size(path, error);
  if (!error) plan[RankOf(name)].push_back({path, 0, size});
}

void PlanFolder(const std::string& path, Ranked& plan) {
  try {
    const format::DiskFolder folder(path);
    std::vector<std::string> names = folder.List();
    const bool is_index = std::any_of(names.begin(), names.end(), [](const std::string& name) {
      return format::CommitGeneration(name).has_value();
    });
    if (!is_index) return;
    std::sort(names.begin(), names.end());
    for (const std::string& name : names) PlanFile(folder, name, plan);
  } catch (const IndexError&) {
    // Passed over.
  }
}

std::vector<std::string> Subfolders(const std::string& root) {
  std::vector<std::string> folders;
  std::error_code error;
  std::filesystem::directory_iterator entry(root, error);
  for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error)) {
    std::error_code ignored;
    const bool is_hidden = entry->path().filename().string().starts_with('.');
    if (!is_hidden && entry->is_directory(ignored)) folders.push_back(entry->path().string());
  }
  std::sort(folders.begin(), folders.end());
  return folders;
}

}  // namespace

std::vector<Extent> PlanWarmUp(const std::string& root) {
  Ranked ranked;
  for (const std::string& folder : Subfolders(root)) PlanFolder(folder, ranked);
  std::vector<Extent> plan;
  for (std::vector<Extent>& extents : ranked) {
    std::move(extents.begin(), extents.end(), std::back_inserter(plan));
  }
  return plan;
}

}  // namespace vantrel::elastic
