#include "elastic/format/segment/deletions.h"

#include <algorithm>
#include <array>
#include <bit>
#include <string>
#include <utility>

namespace vantrel::elastic::format {

Deletions::Deletions(std::shared_ptr<const ByteSource> source, int32_t document_count)
    : source_(std::move(source)), byte_count_(static_cast<uint64_t>(document_count) / 8 + 1) {
  ByteReader reader(source_);
  int32_t documents = reader.ReadInt();
  is_sparse_ = documents == -1;
  if (is_sparse_) documents = reader.ReadInt();
  if (documents != document_count) {
    reader.Damaged(is_sparse_ ? 4 : 0, "deletions are about " + std::to_string(documents) +
                                           " documents, but the segment has " +
                                           std::to_string(document_count));
  }
  const uint64_t count_start = reader.offset();
  count_ = reader.ReadInt();
  if (count_ < 0 || count_ > document_count) {
    reader.Damaged(count_start, "count of deleted documents is " + std::to_string(count_) +
                                    ", but the segment has " + std::to_string(document_count));
  }
  is_sparse_ ? ReadSparse(reader) : ReadDense(reader);
  end_ = reader.offset();
}

void Deletions::ReadDense(ByteReader& reader) {
  bits_offset_ = reader.offset();
  std::array<uint8_t, 4096> piece;
  int64_t seen = 0;
  for (uint64_t left = byte_count_; left > 0;) {
    const auto length = static_cast<size_t>(std::min<uint64_t>(piece.size(), left));
    reader.ReadBytes(std::span(piece.data(), length));
    for (size_t i = 0; i < length; ++i) seen += std::popcount(piece[i]);
    left -= length;
  }
  if (seen != count_) {
    reader.Damaged(bits_offset_, "deleted documents are " + std::to_string(seen) + " by their bits, but " +
                                     std::to_string(count_) + " by their count");
  }
  pages_.resize(kPagesHeld);
}

void Deletions::ReadSparse(ByteReader& reader) {
  uint64_t index = 0;
  for (int64_t left = count_; left > 0;) {
    const uint64_t start = reader.offset();
    const uint32_t gap = reader.ReadVInt();
    index += gap;
    if (index >= byte_count_ || (gap == 0 && sparse_count_ > 0)) {
      reader.Damaged(start, "gap " + std::to_string(gap) + " leads to byte " + std::to_string(index) +
                                " of " + std::to_string(byte_count_));
    }
    const uint64_t bits_offset = reader.offset();
    const uint8_t bits = reader.ReadByte();
    const int seen = std::popcount(bits);
    if (seen == 0 || seen > left) {
      reader.Damaged(start, "byte holds " + std::to_string(seen) + " deleted documents of " +
                                std::to_string(left) + " that are left");
    }
    left -= seen;
    if (sparse_count_++ % kBlockLength == 0) {
      block_starts_.push_back({static_cast<uint32_t>(index), bits_offset});
    }
  }
  blocks_.resize(std::min(block_starts_.size(), kBlocksHeld));
}

uint8_t Deletions::DenseByte(uint32_t index) {
  const uint64_t number = index / kPageSize;
  Page& page = pages_[number % kPagesHeld];
  if (page.number != number) {
    page.number = UINT64_MAX;
    const uint64_t start = number * kPageSize;
    page.bytes.resize(std::min<uint64_t>(kPageSize, byte_count_ - start));
    source_->ReadAt(bits_offset_ + start, page.bytes);
    page.number = number;
  }
  return page.bytes[index % kPageSize];
}

const std::vector<Deletions::SparseByte>& Deletions::SparseBlock(uint64_t number) {
  Block& block = blocks_[number % kBlocksHeld];
  if (block.number == number) return block.bytes;
  constexpr size_t kLongestEntry = 6;
  block.number = UINT64_MAX;
  block.bytes.clear();
  ByteReader reader(source_, kBlockLength * kLongestEntry);
  reader.Seek(block_starts_[number].offset);
  uint32_t index = block_starts_[number].index;
  block.bytes.push_back({index, reader.ReadByte()});
  const uint64_t length = std::min<uint64_t>(kBlockLength, sparse_count_ - number * kBlockLength);
  while (block.bytes.size() < length) {
    index += reader.ReadVInt();
    block.bytes.push_back({index, reader.ReadByte()});
  }
  block.number = number;
  return block.bytes;
}

uint8_t Deletions::SparseByteAt(uint32_t index) {
  const auto after =
      std::upper_bound(block_starts_.begin(), block_starts_.end(), index,
                       [](uint32_t wanted, const BlockStart& block) { return wanted < block.index; });
  if (after == block_starts_.begin()) return 0;
  const auto& bytes = SparseBlock(static_cast<uint64_t>(after - block_starts_.begin()) - 1);
  const auto found =
      std::lower_bound(bytes.begin(), bytes.end(), index,
                       [](const SparseByte& byte, uint32_t wanted) { return byte.index < wanted; });
  return found != bytes.end() && found->index == index ? found->bits : uint8_t{0};
}

void Deletions::ReleasePages() {
  for (Page& page : pages_) page = {};
  for (Block& block : blocks_) block = {};
}

bool Deletions::Contains(int32_t document) {
  const uint32_t index = static_cast<uint32_t>(document) >> 3;
  const uint8_t bits = is_sparse_ ? SparseByteAt(index) : DenseByte(index);
  return (bits >> (document & 7) & 1) != 0;
}

}  // namespace vantrel::elastic::format
