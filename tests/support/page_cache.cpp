#include "support/page_cache.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <system_error>
#include <vector>

#include "support/descriptor.h"

namespace quorelastic::testing {
namespace {

[[noreturn]] void Fail(const std::string& path) {
  throw std::system_error(errno, std::generic_category(), path);
}

Descriptor Open(const std::string& path) {
  Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (file.get() < 0) Fail(path);
  return file;
}

bool ThrowOut(const std::string& path) {
  {
    const Descriptor file = Open(path);
    // What is not on disk yet cannot be thrown out.
    if (fsync(file.get()) != 0) Fail(path);
    posix_fadvise(file.get(), 0, 0, POSIX_FADV_DONTNEED);
  }
  return CountPages(path).resident == 0;
}

}  // namespace

PageCount CountPages(const std::string& path) {
  const Descriptor file = Open(path);
  struct stat status {};
  if (fstat(file.get(), &status) != 0) Fail(path);
  if (status.st_size == 0) return {};
  const auto size = static_cast<size_t>(status.st_size);
  void* const mapped = mmap(nullptr, size, PROT_READ, MAP_SHARED, file.get(), 0);
  if (mapped == MAP_FAILED) Fail(path);
  const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  std::vector<unsigned char> pages((size + page - 1) / page);
  const int counted = mincore(mapped, size, pages.data());
  munmap(mapped, size);
  if (counted != 0) Fail(path);
  const auto resident =
      std::count_if(pages.begin(), pages.end(), [](unsigned char bits) { return (bits & 1) != 0; });
  return {static_cast<uint64_t>(resident), pages.size()};
}

bool ThrowOutOfPageCache(const std::string& folder) {
  // A page that somebody is at stays for a moment.
  for (int attempt = 0; attempt < 5; ++attempt) {
    bool is_cold = true;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
      if (entry.is_regular_file() && !entry.is_symlink())
        is_cold = ThrowOut(entry.path().string()) && is_cold;
    }
    if (is_cold) return true;
    usleep(50'000);
  }
  return false;
}

}  // namespace quorelastic::testing
