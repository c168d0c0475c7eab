#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include "support/memory_folder.h"
#include "vantrel/elastic/index_error.h"

namespace quorelastic::fuzz {

// The bytes of an input, taken from the front.
class FuzzInput {
 public:
  FuzzInput(const uint8_t* data, size_t size) : data_(data), left_(size) {}

  // 0 when none is left.
  uint8_t TakeByte() {
    if (left_ == 0) return 0;
    --left_;
    return *data_++;
  }
  uint32_t TakeNumber() {
    const uint32_t low = TakeByte();
    return low | uint32_t{TakeByte()} << 8;
  }

  // So many, or all that are left where they are fewer.
  std::string TakeBytes(size_t count) {
    std::string bytes(reinterpret_cast<const char*>(data_), std::min(count, left_));
    data_ += bytes.size();
    left_ -= bytes.size();
    return bytes;
  }

  // The same as a file; without a count, all that is left.
  std::shared_ptr<const vantrel::elastic::format::ByteSource> TakeSource(size_t count = SIZE_MAX) {
    return quorelastic::testing::SourceOf(TakeBytes(count));
  }

  // A text, after a byte for its length.
  std::string TakeText() { return TakeBytes(TakeByte()); }

  // All that is left as the files of a folder, each a byte for the length of its name, the name, two bytes for its
  // length, its bytes.
  void TakeFiles(quorelastic::testing::MemoryFolder& folder) {
    while (left_ > 0) {
      const std::string name = TakeText();
      folder.files[name].bytes = TakeBytes(TakeNumber());
    }
  }

  size_t left() const { return left_; }

 private:
  const uint8_t* data_;
  size_t left_;
};

// What a decoder must keep to whatever it is given.
inline void Require(bool kept, const char* promise) {
  if (kept) return;
  std::fprintf(stderr, "broken promise: %s\n", promise);
  std::abort();
}

// Runs a decoder: an IndexError is what bad bytes must end in, anything else ends the program.
template <typename Decode>
int DecodeWithinBounds(Decode decode) {
  try {
    decode();
  } catch (const vantrel::elastic::IndexError&) {
    return 0;
  }
  return 0;
}

}  // namespace quorelastic::fuzz

// The entry point of libFuzzer and of the replaying main alike; data that leads to a crash is to be kept.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);
