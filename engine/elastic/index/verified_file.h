#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <span>
#include <string>

#include "elastic/format/io/byte_source.h"
#include "elastic/manifest/manifest.h"

namespace vantrel::elastic {

// Throws IndexDamagedError where a file is of another size than it was written with.
void RequireSize(const format::ByteSource& file, const format::Manifest::File& expected);

// What is known of a file that the index library may read. As long as there are no digests, it is taken as it is;
// from then on, each block (block_digest.h) is compared with its digest before the first byte of it is handed out,
// once in the life of this object. Thread-safe.
class FileVerification {
 public:
  // Takes the digests, once. The second time it does nothing.
  void Expect(const format::Manifest::File& expected);

  // The digests, nothing as long as there are none.
  const format::Manifest::File* expected() const { return known_.load(std::memory_order_acquire); }

  // Reads the blocks in which the range lies, as far as that was not done before. Throws IndexDamagedError where one
  // is not as it was written, where the file has another size, and where the range is not within; and what reading
  // throws.
  void Verify(const format::ByteSource& file, uint64_t offset, uint64_t length);

 private:
  std::mutex mutex_;  // for Expect
  std::unique_ptr<const format::Manifest::File> expected_;
  std::unique_ptr<std::atomic<bool>[]> is_verified_;  // by block
  std::atomic<const format::Manifest::File*> known_ = nullptr;
};

// A file whose blocks are verified as they are read.
class VerifiedFile : public format::ByteSource {
 public:
  // Throws IndexDamagedError where the size is not that of the digests.
  VerifiedFile(std::shared_ptr<const format::ByteSource> file,
               std::shared_ptr<FileVerification> verification);

  const std::string& name() const override { return file_->name(); }
  uint64_t size() const override { return file_->size(); }
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override;

 private:
  std::shared_ptr<const format::ByteSource> file_;
  std::shared_ptr<FileVerification> verification_;
};

}  // namespace vantrel::elastic
