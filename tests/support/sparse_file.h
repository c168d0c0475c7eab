#pragma once

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <utility>

namespace quorelastic::testing {

// Writes a file with holes: gigabytes of zeros that take no room on disk.
class SparseFile {
 public:
  explicit SparseFile(std::string path)
      : path_(std::move(path)), out_(path_, std::ios::binary | std::ios::trunc) {}

  SparseFile& Bytes(const std::string& bytes) {
    out_.seekp(static_cast<std::streamoff>(size_))
        .write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    size_ += bytes.size();
    return *this;
  }
  SparseFile& Hole(uint64_t length) {
    size_ += length;
    return *this;
  }

  // Writes the last hole as well. Throws where the file system has refused anything.
  void Close() {
    out_.close();
    if (!out_) throw std::runtime_error("cannot write " + path_);
    std::filesystem::resize_file(path_, size_);
  }

 private:
  std::string path_;
  std::ofstream out_;
  uint64_t size_ = 0;
};

}  // namespace quorelastic::testing
