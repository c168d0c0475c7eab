#include "elastic/index/verified_file.h"

#include <algorithm>
#include <utility>

#include "elastic/manifest/block_digest.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

using format::kDigestBlock;

void VerifyBlock(const format::ByteSource& file, const format::Manifest::File& expected, uint64_t block) {
  format::ReadBuffer buffer;
  const uint64_t digest = format::DigestOfBlock(file, block, buffer);
  if (digest == expected.digests[block]) return;
  throw IndexDamagedError(file.name(), block * kDigestBlock,
                          "the block that begins here is not what was written: its digest is " +
                              format::DigestText(digest) + ", not " +
                              format::DigestText(expected.digests[block]));
}

}  // namespace

void RequireSize(const format::ByteSource& file, const format::Manifest::File& expected) {
  if (file.size() == expected.size) return;
  throw IndexDamagedError(file.name(), std::min(file.size(), expected.size),
                          "the file is not what was written: it has " + std::to_string(file.size()) +
                              " bytes, not " + std::to_string(expected.size));
}

void FileVerification::Expect(const format::Manifest::File& expected) {
  const std::lock_guard lock(mutex_);
  if (expected_ != nullptr) return;
  is_verified_ = std::make_unique<std::atomic<bool>[]>(expected.digests.size());
  expected_ = std::make_unique<const format::Manifest::File>(expected);
  known_.store(expected_.get(), std::memory_order_release);
}

void FileVerification::Verify(const format::ByteSource& file, uint64_t offset, uint64_t length) {
  const format::Manifest::File* const expected = this->expected();
  if (expected == nullptr || length == 0) return;
  RequireSize(file, *expected);
  if (offset > expected->size || length > expected->size - offset) {
    throw IndexDamagedError(file.name(), expected->size, "something refers to what is past the end");
  }
  const uint64_t last = (offset + length - 1) / kDigestBlock;
  for (uint64_t block = offset / kDigestBlock; block <= last; ++block) {
    if (is_verified_[block].load(std::memory_order_relaxed)) continue;
    VerifyBlock(file, *expected, block);
    is_verified_[block].store(true, std::memory_order_relaxed);
  }
}

VerifiedFile::VerifiedFile(std::shared_ptr<const format::ByteSource> file,
                           std::shared_ptr<FileVerification> verification)
    : file_(std::move(file)), verification_(std::move(verification)) {
  if (const format::Manifest::File* const expected = verification_->expected())
    RequireSize(*file_, *expected);
}

void VerifiedFile::ReadAt(uint64_t offset, std::span<uint8_t> out) const {
  verification_->Verify(*file_, offset, out.size());
  file_->ReadAt(offset, out);
}

}  // namespace vantrel::elastic
