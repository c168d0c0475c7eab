#include "elastic/format/block_digest.h"

#include <xxhash.h>

#include <algorithm>
#include <new>

namespace vantrel::elastic::format {
namespace {

// Small enough to stay in the processor's cache between being read and being digested.
constexpr size_t kPiece = size_t{256} << 10;

}  // namespace

BlockDigest::BlockDigest() : state_(XXH3_createState(), [](XXH3_state_s* state) { XXH3_freeState(state); }) {
  if (state_ == nullptr) throw std::bad_alloc();
  XXH3_64bits_reset(state_.get());
}

void BlockDigest::Add(std::span<const uint8_t> piece) {
  XXH3_64bits_update(state_.get(), piece.data(), piece.size());
}

uint64_t BlockDigest::value() const { return XXH3_64bits_digest(state_.get()); }

uint64_t BlockDigest::Of(std::span<const uint8_t> block) { return XXH3_64bits(block.data(), block.size()); }

std::string DigestText(uint64_t digest) {
  std::string digits(kDigestDigits, '0');
  for (size_t i = kDigestDigits; i-- > 0; digest >>= 4) digits[i] = "0123456789abcdef"[digest & 0xf];
  return digits;
}

std::vector<uint64_t> DigestBlocks(const ByteSource& file) {
  std::vector<uint64_t> digests;
  digests.reserve(CountDigestBlocks(file.size()));
  std::vector<uint8_t> buffer(std::min<uint64_t>(kPiece, file.size()));
  for (uint64_t start = 0; start < file.size(); start += kDigestBlock) {
    const uint64_t end = std::min(start + kDigestBlock, file.size());
    BlockDigest digest;
    for (uint64_t at = start; at < end;) {
      const std::span<uint8_t> piece(buffer.data(), std::min<uint64_t>(buffer.size(), end - at));
      file.ReadAt(at, piece);
      digest.Add(piece);
      at += piece.size();
    }
    digests.push_back(digest.value());
  }
  return digests;
}

}  // namespace vantrel::elastic::format
