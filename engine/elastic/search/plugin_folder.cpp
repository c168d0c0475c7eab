#include "elastic/search/plugin_folder.h"

#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <mutex>
#include <system_error>
#include <utility>

#include "elastic/common/path.h"
#include "elastic/format/io/folder.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

[[noreturn]] void FailBySystem(const std::string& path, const std::string& problem, int error_number) {
  throw PluginLoadError(path, problem + ": " + std::generic_category().message(error_number));
}

// The opened file or folder is the business of nobody but root and us.
void CheckOwner(const FileDescriptor& file, const std::string& path, mode_t type) {
  struct stat status {};
  if (fstat(file.get(), &status) != 0) FailBySystem(path, "cannot examine it", errno);
  if ((status.st_mode & S_IFMT) != type) throw PluginLoadError(path, "is of the wrong kind");
  if (status.st_uid != 0 && status.st_uid != geteuid()) {
    throw PluginLoadError(path, "belongs to neither root nor the user who runs this");
  }
  if ((status.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
    throw PluginLoadError(path, "can be written by others than its owner");
  }
}

struct CloseFolder {
  void operator()(DIR* stream) const { closedir(stream); }
};

// A shared object, loaded by a name that no other has as long as its file is open. (The loader takes two files
// of one name for the same.)
struct LoadedFile {
  LoadedFile() = default;
  LoadedFile(const LoadedFile&) = delete;
  LoadedFile& operator=(const LoadedFile&) = delete;
  ~LoadedFile() {
    if (library != nullptr) dlclose(library);
  }

  FileDescriptor file;
  void* library = nullptr;
};

// Keeps a shared object for good: what its plugin makes may be in use anywhere, to the very end.
void Keep(std::unique_ptr<LoadedFile> loaded) {
  static std::mutex mutex;
  static auto& kept = *new std::vector<std::unique_ptr<LoadedFile>>;
  const std::lock_guard lock(mutex);
  kept.push_back(std::move(loaded));
}

std::shared_ptr<const SearchPlugin> MakePlugin(void* library, const std::string& path) {
  void* const symbol = dlsym(library, kSearchPluginEntryName);
  if (symbol == nullptr) {
    throw PluginLoadError(path, std::string("is no search plugin: it has no ") + kSearchPluginEntryName);
  }
  const auto enter = reinterpret_cast<const SearchPluginEntry* (*)()>(symbol);
  const SearchPluginEntry* const entry = enter();
  if (entry == nullptr) throw PluginLoadError(path, "offers no plugin");
  if (entry->version != kSearchPluginVersion) {
    throw PluginLoadError(path, "is made for version " + std::to_string(entry->version) +
                                    " of the plugin interface, this is version " +
                                    std::to_string(kSearchPluginVersion));
  }
  std::shared_ptr<const SearchPlugin> plugin(entry->create());
  if (plugin == nullptr) throw PluginLoadError(path, "makes no plugin");
  return plugin;
}

}  // namespace

PluginFolder::PluginFolder(std::string path) : path_(std::move(path)) {
  folder_ = FileDescriptor(open(path_.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!folder_.is_open()) FailBySystem(path_, "cannot open the folder", errno);
  CheckOwner(folder_, path_, S_IFDIR);
}

std::vector<std::string> PluginFolder::List() const {
  const int descriptor = openat(folder_.get(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  const std::unique_ptr<DIR, CloseFolder> stream(descriptor < 0 ? nullptr : fdopendir(descriptor));
  if (stream == nullptr) {
    const int failure = errno;
    if (descriptor >= 0) close(descriptor);
    FailBySystem(path_, "cannot read the folder", failure);
  }
  std::vector<std::string> names;
  for (;;) {
    errno = 0;
    const dirent* const entry = readdir(stream.get());
    if (entry == nullptr) break;
    const std::string name = entry->d_name;
    if (name.ends_with(".so")) names.push_back(name);
  }
  if (errno != 0) FailBySystem(path_, "cannot read the folder", errno);
  std::sort(names.begin(), names.end());
  return names;
}

std::shared_ptr<const SearchPlugin> PluginFolder::Load(const std::string& name) const {
  const std::string path = JoinPath(path_, name);
  auto loaded = std::make_unique<LoadedFile>();
  loaded->file =
      FileDescriptor(openat(folder_.get(), name.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
  if (!loaded->file.is_open()) FailBySystem(path, "cannot open the file", errno);
  CheckOwner(loaded->file, path, S_IFREG);
  const std::string opened = "/proc/self/fd/" + std::to_string(loaded->file.get());
  loaded->library = dlopen(opened.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (loaded->library == nullptr) {
    const char* const reason = dlerror();
    throw PluginLoadError(path, std::string("cannot load it: ") + (reason == nullptr ? "" : reason));
  }
  auto plugin = MakePlugin(loaded->library, path);
  Keep(std::move(loaded));
  return plugin;
}

}  // namespace vantrel::elastic
