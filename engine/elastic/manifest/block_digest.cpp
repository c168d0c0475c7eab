#include "elastic/manifest/block_digest.h"

#include <xxhash.h>

#include <algorithm>
#include <new>

namespace vantrel::elastic::format {

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

uint64_t DigestOfBlock(const ByteSource& file, uint64_t block, ReadBuffer& buffer) {
  const uint64_t start = block * kDigestBlock;
  BlockDigest digest;
  ReadToDigest(file, start, std::min(start + kDigestBlock, file.size()), buffer,
               [&](uint64_t /*offset*/, std::span<const uint8_t> piece) { digest.Add(piece); });
  return digest.value();
}

std::vector<uint64_t> DigestBlocks(const ByteSource& file) {
  std::vector<uint64_t> digests(CountDigestBlocks(file.size()));
  ReadBuffer buffer;
  for (uint64_t block = 0; block < digests.size(); ++block)
    digests[block] = DigestOfBlock(file, block, buffer);
  return digests;
}

}  // namespace vantrel::elastic::format
