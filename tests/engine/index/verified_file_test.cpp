#include "elastic/index/verified_file.h"

#include <gtest/gtest.h>

#include <array>
#include <vector>

#include "elastic/manifest/block_digest.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::SourceOf;

constexpr uint64_t kBlock = format::kDigestBlock;

// A file of two blocks and a half that counts the bytes read of it.
class CountedFile : public format::ByteSource {
 public:
  CountedFile() : bytes_(2 * kBlock + kBlock / 2, 'x') {}

  const std::string& name() const override { return name_; }
  uint64_t size() const override { return bytes_.size(); }
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    std::copy_n(bytes_.begin() + static_cast<ptrdiff_t>(offset), out.size(), out.begin());
    bytes_read_ += out.size();
  }

  void Damage(uint64_t offset) { bytes_[offset] = 'y'; }
  uint64_t TakeBytesRead() { return std::exchange(bytes_read_, 0); }

 private:
  std::string name_ = "memory";
  std::string bytes_;
  mutable uint64_t bytes_read_ = 0;
};

class VerifiedFileTest : public ::testing::Test {
 protected:
  VerifiedFileTest() {
    expected_ = {.name = "_0.fdt", .size = file_->size(), .digests = format::DigestBlocks(*file_)};
    file_->TakeBytesRead();
  }

  static std::vector<uint8_t> Read(const VerifiedFile& file, uint64_t offset, size_t length) {
    std::vector<uint8_t> bytes(length);
    file.ReadAt(offset, bytes);
    return bytes;
  }

  std::shared_ptr<CountedFile> file_ = std::make_shared<CountedFile>();
  std::shared_ptr<FileVerification> verification_ = std::make_shared<FileVerification>();
  format::Manifest::File expected_;
};

TEST_F(VerifiedFileTest, ReadsABlockWholeBeforeItsFirstByteAndNotAgain) {
  verification_->Expect(expected_);
  const VerifiedFile verified(file_, verification_);
  EXPECT_EQ(file_->TakeBytesRead(), 0U);
  EXPECT_EQ(Read(verified, kBlock + 5, 3), std::vector<uint8_t>(3, 'x'));
  EXPECT_EQ(file_->TakeBytesRead(), kBlock + 3);
  Read(verified, kBlock, 10);
  EXPECT_EQ(file_->TakeBytesRead(), 10U);
  // Also for who opens the file again.
  Read(VerifiedFile(file_, verification_), kBlock, 10);
  EXPECT_EQ(file_->TakeBytesRead(), 10U);
}

TEST_F(VerifiedFileTest, VerifiesEachBlockThatARangeTouches) {
  verification_->Expect(expected_);
  const VerifiedFile verified(file_, verification_);
  Read(verified, kBlock - 1, kBlock + 2);
  EXPECT_EQ(file_->TakeBytesRead(), file_->size() + kBlock + 2);
  Read(verified, 0, 0);
  EXPECT_EQ(file_->TakeBytesRead(), 0U);
}

TEST_F(VerifiedFileTest, RefusesWhatLiesInADamagedBlockAndNothingElse) {
  verification_->Expect(expected_);
  const VerifiedFile verified(file_, verification_);
  file_->Damage(file_->size() - 1);
  Read(verified, 0, 2 * kBlock);
  for (int i = 0; i < 2; ++i) {
    ExpectDamage(2 * kBlock, "is not what was written: its digest is ",
                 [&] { Read(verified, 2 * kBlock, 1); });
  }
  ExpectDamage(2 * kBlock, "is not what was written", [&] { Read(verified, 2 * kBlock - 1, 2); });
}

TEST_F(VerifiedFileTest, RefusesAFileOfAnotherSize) {
  verification_->Expect(expected_);
  ExpectDamage(5, "it has 5 bytes, not " + std::to_string(file_->size()),
               [&] { VerifiedFile(SourceOf("12345"), verification_); });
}

TEST_F(VerifiedFileTest, ReadsWithoutDigestsAndVerifiesAsSoonAsThereAreSome) {
  const VerifiedFile verified(file_, verification_);
  EXPECT_EQ(verification_->expected(), nullptr);
  file_->Damage(7);
  EXPECT_EQ(Read(verified, 7, 1), std::vector<uint8_t>(1, 'y'));
  EXPECT_EQ(file_->TakeBytesRead(), 1U);
  verification_->Expect(expected_);
  ExpectDamage(0, "is not what was written", [&] { Read(verified, 7, 1); });
}

TEST_F(VerifiedFileTest, KeepsTheFirstDigests) {
  verification_->Expect(expected_);
  format::Manifest::File other = expected_;
  other.digests[0] ^= 1;
  verification_->Expect(other);
  Read(VerifiedFile(file_, verification_), 0, 1);
}

}  // namespace
}  // namespace vantrel::elastic
