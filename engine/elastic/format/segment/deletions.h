#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"

namespace vantrel::elastic::format {

// The deleted documents of a segment (.del), one bit a document, lowest bit first. Layout:
//
//   Int documents, Int deleted ones, then (documents / 8) + 1 bytes of bits
//   or, where few are deleted: Int -1, Int documents, Int deleted ones, then, for each byte that is not 0:
//   VInt gap to it from the one before (the first: from byte 0), Byte its bits
//
// Memory stays bounded, whatever the number of documents: the bits are paged in as they are asked for, and of
// the second layout just every 256th byte's place is kept. For one thread at a time.
class Deletions {
 public:
  // Reads the file once and counts the bits. Throws IndexDamagedError, also when the file is not about
  // `document_count` documents, and IndexIoError.
  Deletions(std::shared_ptr<const ByteSource> source, int32_t document_count);

  int32_t count() const { return count_; }

  // Where in the file the layout ends; nothing should follow.
  uint64_t end() const { return end_; }

  // `document` must lie in the segment. Throws IndexIoError, and IndexDamagedError where the file has changed
  // since it was first read.
  bool Contains(int32_t document);

  // Gives back the memory of what was paged in.
  void ReleasePages();

 private:
  static constexpr size_t kPageSize = size_t{64} << 10;
  static constexpr size_t kPagesHeld = 16;
  static constexpr size_t kBlockLength = 256;  // sparse bytes
  static constexpr size_t kBlocksHeld = 512;

  struct Page {
    uint64_t number = UINT64_MAX;
    std::vector<uint8_t> bytes;
  };
  struct SparseByte {
    uint32_t index;
    uint8_t bits;
  };
  // A run of sparse bytes, all but the last of kBlockLength.
  struct BlockStart {
    uint32_t index;   // of its first sparse byte
    uint64_t offset;  // where that one's bits stand in the file
  };
  struct Block {
    uint64_t number = UINT64_MAX;
    std::vector<SparseByte> bytes;
  };

  void ReadDense(ByteReader& reader);
  void ReadSparse(ByteReader& reader);
  uint8_t DenseByte(uint32_t index);
  uint8_t SparseByteAt(uint32_t index);
  const std::vector<SparseByte>& SparseBlock(uint64_t number);

  std::shared_ptr<const ByteSource> source_;
  int32_t count_ = 0;
  uint64_t byte_count_;
  bool is_sparse_ = false;
  uint64_t end_ = 0;
  std::vector<BlockStart> block_starts_;
  uint64_t sparse_count_ = 0;
  std::vector<Block> blocks_;
  uint64_t bits_offset_ = 0;
  std::vector<Page> pages_;
};

}  // namespace vantrel::elastic::format
