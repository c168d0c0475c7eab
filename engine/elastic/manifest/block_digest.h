#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"

struct XXH3_state_s;

namespace vantrel::elastic::format {

// A file is digested in blocks of this size, the last one being what is left: so a difference is known by its place,
// and parts of a file can be digested apart. A file without bytes has no block.
inline constexpr uint64_t kDigestBlock = uint64_t{1} << 20;

constexpr uint64_t CountDigestBlocks(uint64_t file_size) {
  return file_size / kDigestBlock + (file_size % kDigestBlock == 0 ? 0 : 1);
}

// The digest of one block that comes in pieces: XXH3 of 64 bits, without a seed. It tells decay, not malice. For one
// thread at a time.
class BlockDigest {
 public:
  // Throws std::bad_alloc.
  BlockDigest();

  void Add(std::span<const uint8_t> piece);

  // Of all pieces so far.
  uint64_t value() const;

  static uint64_t Of(std::span<const uint8_t> block);

 private:
  std::unique_ptr<XXH3_state_s, void (*)(XXH3_state_s*)> state_;
};

// A digest in hexadecimal digits, always as many.
inline constexpr size_t kDigestDigits = 16;
std::string DigestText(uint64_t digest);

// Bytes to read into, kept from one range to the next and grown where need be.
class ReadBuffer {
 public:
  std::span<uint8_t> Take(size_t length) {
    if (size_ < length) {
      bytes_ = std::make_unique_for_overwrite<uint8_t[]>(length);
      size_ = length;
    }
    return {bytes_.get(), length};
  }

 private:
  std::unique_ptr<uint8_t[]> bytes_;
  size_t size_ = 0;
};

// Reads a range of a file in pieces that stay in the processor's cache until they are digested: calls
// take(offset, piece) for each, in order. Throws what reading throws.
template <typename Take>
void ReadToDigest(const ByteSource& file, uint64_t from, uint64_t to, ReadBuffer& buffer, Take take) {
  constexpr uint64_t kPiece = uint64_t{256} << 10;
  while (from < to) {
    const std::span<uint8_t> piece = buffer.Take(std::min(kPiece, to - from));
    file.ReadAt(from, piece);
    take(from, std::span<const uint8_t>(piece));
    from += piece.size();
  }
}

// The digest of a block of a file, by its number. Throws what reading throws.
uint64_t DigestOfBlock(const ByteSource& file, uint64_t block, ReadBuffer& buffer);

// The digests of a whole file. Throws what reading throws.
std::vector<uint64_t> DigestBlocks(const ByteSource& file);

}  // namespace vantrel::elastic::format
