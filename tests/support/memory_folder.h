#pragma once

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <utility>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"
#include "vantrel/elastic/index_error.h"

namespace quorelastic::testing {

// What a file in memory holds, and where it fails.
struct MemoryFile {
  std::string bytes = {};
  uint64_t zeros_after = 0;                  // a hole that follows the bytes, as in a sparse file
  std::optional<uint64_t> broken_from = {};  // reading this byte or a later one is a medium error
  std::function<void()> before_read = {};    // called by whichever thread reads
};

class MemorySource : public vantrel::elastic::format::ByteSource {
 public:
  MemorySource(std::string name, MemoryFile file) : name_(std::move(name)), file_(std::move(file)) {}

  const std::string& name() const override { return name_; }
  uint64_t size() const override { return file_.bytes.size() + file_.zeros_after; }

  // Asked for bytes past its size, it fails as a file does that shrank.
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    using vantrel::elastic::IndexIoError;
    if (file_.before_read) file_.before_read();
    if (offset > size() || out.size() > size() - offset) {
      throw IndexIoError(name_, "read past the end of the source", EINVAL);
    }
    if (file_.broken_from.has_value() && !out.empty() && offset + out.size() > *file_.broken_from) {
      throw IndexIoError(name_, "cannot read", EIO);
    }
    std::fill(out.begin(), out.end(), uint8_t{0});
    if (offset >= file_.bytes.size()) return;
    const size_t length = std::min<size_t>(out.size(), file_.bytes.size() - offset);
    std::copy_n(file_.bytes.begin() + static_cast<ptrdiff_t>(offset), length, out.begin());
  }

 private:
  std::string name_;
  MemoryFile file_;
};

// All bytes of a source.
inline std::string ContentOf(const vantrel::elastic::format::ByteSource& source) {
  std::string bytes(source.size(), '\0');
  source.ReadAt(0, std::span(reinterpret_cast<uint8_t*>(bytes.data()), bytes.size()));
  return bytes;
}

inline std::shared_ptr<const vantrel::elastic::format::ByteSource> SourceOf(
    const std::string& bytes, uint64_t zeros_after = 0, std::optional<uint64_t> broken_from = {}) {
  return std::make_shared<MemorySource>("memory", MemoryFile{bytes, zeros_after, broken_from});
}

// A folder in memory. Its hooks run before a listing or an opening takes place, so that a test can play the
// writer that changes the folder meanwhile.
class MemoryFolder : public vantrel::elastic::format::Folder {
 public:
  std::map<std::string, MemoryFile> files;
  std::function<void()> before_list;
  std::function<void(const std::string& name)> before_open;
  mutable int opened = 0;  // how many times a file was asked for
  mutable int listed = 0;  // how many times the names were asked for

  const std::string& path() const override { return path_; }

  std::vector<std::string> List() const override {
    ++listed;
    if (before_list) before_list();
    std::vector<std::string> names = {".", ".."};
    for (const auto& [name, file] : files) names.push_back(name);
    return names;
  }

  bool Exists(const std::string& name) const override { return files.contains(name); }

  std::shared_ptr<const vantrel::elastic::format::ByteSource> Open(const std::string& name) const override {
    ++opened;
    if (before_open) before_open(name);
    const auto found = files.find(name);
    if (found == files.end()) {
      throw vantrel::elastic::IndexIoError(path_ + "/" + name, "cannot open file", ENOENT);
    }
    return std::make_shared<MemorySource>(path_ + "/" + name, found->second);
  }

 private:
  std::string path_ = "memory";
};

}  // namespace quorelastic::testing
