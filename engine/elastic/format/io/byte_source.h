#pragma once

#include <cstdint>
#include <span>
#include <string>

namespace vantrel::elastic::format {

// An immutable run of bytes: a file, or a part of one. May be read by several threads at once.
class ByteSource {
 public:
  ByteSource() = default;
  ByteSource(const ByteSource&) = delete;
  ByteSource& operator=(const ByteSource&) = delete;
  virtual ~ByteSource() = default;

  // What error messages call it.
  virtual const std::string& name() const = 0;

  // Its length in bytes, fixed when it was opened.
  virtual uint64_t size() const = 0;

  // Fills `out` with the bytes from `offset` on. The range must lie within size(). Throws IndexError where
  // the bytes cannot be had: IndexIoError when the medium fails, also when the file has shrunk meanwhile.
  virtual void ReadAt(uint64_t offset, std::span<uint8_t> out) const = 0;
};

}  // namespace vantrel::elastic::format
