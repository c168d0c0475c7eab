#include "data_root/data_root.h"

#include <fcntl.h>
#include <spdlog/spdlog.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <stdexcept>
#include <system_error>

#include "data_root/index_name.h"
#include "elastic/common/durable_file.h"

namespace quorelasticd {
namespace {

namespace fs = std::filesystem;
using vantrel::elastic::FileLock;
using vantrel::elastic::SyncFolder;

constexpr mode_t kFolderMode = 0750;
constexpr std::string_view kNewPrefix = ".new-";
constexpr std::string_view kOldPrefix = ".old-";

[[noreturn]] void Fail(const std::string& path, int error_number) {
  throw std::system_error(error_number, std::generic_category(), path);
}

void MakeFolder(const std::string& path) {
  if (mkdir(path.c_str(), kFolderMode) != 0 && errno != EEXIST) Fail(path, errno);
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) Fail(path, errno);
  if (!S_ISDIR(status.st_mode)) Fail(path, ENOTDIR);
}

bool IsFolder(const std::string& path) {
  struct stat status {};
  return lstat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

void Rename(const std::string& from, const std::string& to) {
  if (rename(from.c_str(), to.c_str()) != 0) Fail(from, errno);
}

}  // namespace

DataRoot::DataRoot(const std::string& path) : path_(path), import_path_(path + "/import") {
  MakeFolder(path_);
  lock_ = FileLock::TryLock(path_ + "/daemon.lock", 0640);
  if (!lock_.has_value()) throw std::runtime_error(path_ + ": another daemon runs on this data folder");
  MakeFolder(import_path_);
  Sweep();
}

std::vector<std::string> DataRoot::ListIndexes() const {
  std::vector<std::string> names;
  for (const fs::directory_entry& entry : fs::directory_iterator(path_)) {
    const std::string name = entry.path().filename().string();
    if (IsIndexName(name) && entry.is_directory() && !entry.is_symlink()) names.push_back(name);
  }
  std::sort(names.begin(), names.end());
  return names;
}

bool DataRoot::HasIndex(const std::string& name) const { return IsFolder(IndexPath(name)); }

std::string DataRoot::IndexPath(const std::string& name) const { return path_ + "/" + name; }

std::string DataRoot::ClearHiddenPath(const std::string& name) const {
  const std::string path = path_ + "/" + std::string(kNewPrefix) + name;
  fs::remove_all(path);  // of an attempt that failed
  return path;
}

void DataRoot::ShowIndex(const std::string& name) const {
  Rename(path_ + "/" + std::string(kNewPrefix) + name, IndexPath(name));
  SyncFolder(path_);
}

std::string DataRoot::HideIndex(const std::string& name) const {
  const std::string hidden = path_ + "/" + std::string(kOldPrefix) + name;
  fs::remove_all(hidden);  // of a removal that failed
  Rename(IndexPath(name), hidden);
  SyncFolder(path_);
  return hidden;
}

void DataRoot::Sweep() const {
  for (const fs::directory_entry& entry : fs::directory_iterator(path_)) {
    const std::string name = entry.path().filename().string();
    if (!name.starts_with(kNewPrefix) && !name.starts_with(kOldPrefix)) continue;
    std::error_code error;
    fs::remove_all(entry.path(), error);
    if (error) spdlog::warn("{}: cannot be removed wholly: {}", entry.path().string(), error.message());
  }
}

}  // namespace quorelasticd
