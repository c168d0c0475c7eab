#include "elastic/check/digest_check.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "elastic/check/mismatch.h"

namespace vantrel::elastic::check {
namespace {

using format::BlockDigest;
using format::kDigestBlock;

constexpr uint32_t kUnderWay = std::numeric_limits<uint32_t>::max();

// Hands what is read on to the check.
class CheckedSource : public format::ByteSource {
 public:
  CheckedSource(std::shared_ptr<const format::ByteSource> source, std::shared_ptr<FileDigestCheck> check)
      : source_(std::move(source)), check_(std::move(check)) {}

  const std::string& name() const override { return source_->name(); }
  uint64_t size() const override { return source_->size(); }
  void ReadAt(uint64_t offset, std::span<uint8_t> out) const override {
    source_->ReadAt(offset, out);
    check_->Take(offset, out);
  }

 private:
  std::shared_ptr<const format::ByteSource> source_;
  std::shared_ptr<FileDigestCheck> check_;
};

}  // namespace

FileDigestCheck::FileDigestCheck(std::shared_ptr<const format::ByteSource> source,
                                 const format::Manifest::File& expected)
    : source_(std::move(source)), expected_(expected), done_(expected.digests.size()) {}

uint64_t FileDigestCheck::LengthOf(uint64_t block) const {
  return std::min(kDigestBlock, expected_.size - block * kDigestBlock);
}

void FileDigestCheck::Take(uint64_t offset, std::span<const uint8_t> bytes) {
  if (source_->size() != expected_.size) return;
  while (!bytes.empty()) {
    const uint64_t block = offset / kDigestBlock;
    const uint64_t from = offset % kDigestBlock;
    const auto piece = bytes.first(std::min<uint64_t>(bytes.size(), kDigestBlock - from));
    const uint64_t to = from + piece.size();
    Claimed claimed = Claim(block, from, to);
    if (claimed.digest != nullptr) {
      claimed.digest->Add(piece.subspan(claimed.done - from));
      Return(block, to, std::move(claimed.digest));
    }
    offset += piece.size();
    bytes = bytes.subspan(piece.size());
  }
}

// The digest of a block, if that can go on somewhere from `from` up to `to`, and up to where it is done.
FileDigestCheck::Claimed FileDigestCheck::Claim(uint64_t block, uint64_t from, uint64_t to) {
  const std::lock_guard lock(mutex_);
  const uint64_t done = done_[block];
  if (done < from || done >= to) return {};
  DigestPtr digest = done == 0 ? std::make_unique<BlockDigest>() : std::move(begun_.extract(block).mapped());
  done_[block] = kUnderWay;
  return {std::move(digest), done};
}

void FileDigestCheck::Return(uint64_t block, uint64_t to, DigestPtr digest) {
  const std::lock_guard lock(mutex_);
  if (to < LengthOf(block)) {
    begun_[block] = std::move(digest);  // first: where there is no memory for it, nobody goes on with it
    done_[block] = static_cast<uint32_t>(to);
    return;
  }
  done_[block] = static_cast<uint32_t>(to);
  const uint64_t found = digest->value();
  if (found == expected_.digests[block]) return;
  if (differing_++ > 0 && first_differing_ < block) return;
  first_differing_ = block;
  found_ = found;
}

void FileDigestCheck::Finish() {
  const std::string& file = source_->name();
  RequireEqual(Grade::kDamaged, file, 0, "the size in the manifest,", expected_.size, source_->size());
  format::ReadBuffer buffer;
  for (uint64_t block = 0; block < done_.size(); ++block) {
    const uint64_t start = block * kDigestBlock;
    format::ReadToDigest(*source_, start + done_[block], start + LengthOf(block), buffer,
                         [this](uint64_t offset, std::span<const uint8_t> piece) { Take(offset, piece); });
  }
  if (differing_ == 0) return;
  std::string found = "digest " + format::DigestText(found_);
  if (differing_ > 1)
    found.append(", and ").append(std::to_string(differing_ - 1)).append(" more that differ");
  Refuse(Grade::kDamaged, file, first_differing_ * kDigestBlock,
         "a block of " + std::to_string(LengthOf(first_differing_)) +
             " bytes with the digest in the manifest, " +
             format::DigestText(expected_.digests[first_differing_]),
         found);
}

std::shared_ptr<const format::ByteSource> DigestCheckedFolder::Open(const std::string& name) const {
  auto source = folder().Open(name);
  const format::Manifest::File* expected = manifest_.Find(name);
  if (expected == nullptr) return source;
  const std::lock_guard lock(mutex_);
  const auto [entry, is_new] = checks_.try_emplace(name);
  if (is_new) entry->second = std::make_shared<FileDigestCheck>(source, *expected);
  if (entry->second == nullptr) return source;
  return std::make_shared<CheckedSource>(std::move(source), entry->second);
}

std::vector<std::shared_ptr<FileDigestCheck>> DigestCheckedFolder::TakeOpened() const {
  const std::lock_guard lock(mutex_);
  std::vector<std::shared_ptr<FileDigestCheck>> opened;
  for (auto& [name, check] : checks_) {
    if (check != nullptr) opened.push_back(std::exchange(check, nullptr));
  }
  return opened;
}

}  // namespace vantrel::elastic::check
