#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <unordered_map>
#include <vector>

#include "elastic/format/io/folder.h"
#include "elastic/manifest/block_digest.h"
#include "elastic/manifest/manifest.h"

namespace vantrel::elastic::check {

// Compares the bytes of one file with a manifest. Who reads the file for another purpose hands over what is read, in
// any order, and bytes more than once; a block that came from its start to its end need not be read again.
// Thread-safe, but for Finish().
class FileDigestCheck {
 public:
  // `expected` must outlive it.
  FileDigestCheck(std::shared_ptr<const format::ByteSource> source, const format::Manifest::File& expected);

  // Of the file, without its folder.
  const std::string& name() const { return expected_.name; }

  void Take(uint64_t offset, std::span<const uint8_t> bytes);

  // Reads what was not handed over. Throws Mismatch where the file is not as the manifest says, and what reading
  // throws.
  void Finish();

 private:
  using DigestPtr = std::unique_ptr<format::BlockDigest>;
  struct Claimed {
    DigestPtr digest;   // of a block; empty where it cannot go on here
    uint64_t done = 0;  // up to where, from the block's start
  };

  uint64_t LengthOf(uint64_t block) const;
  Claimed Claim(uint64_t block, uint64_t from, uint64_t to);
  void Return(uint64_t block, uint64_t to, DigestPtr digest);

  std::shared_ptr<const format::ByteSource> source_;
  const format::Manifest::File& expected_;

  std::mutex mutex_;  // for what follows
  // Up to where each block is digested, from its start; kUnderWay while somebody is at it.
  std::vector<uint32_t> done_;
  std::unordered_map<uint64_t, DigestPtr> begun_;  // of blocks done in part
  uint64_t differing_ = 0;                         // blocks
  uint64_t first_differing_ = 0;                   // its number, if there is one
  uint64_t found_ = 0;                             // its digest
};

// A folder whose files are compared with a manifest while they are read. Both must outlive it, and it the files.
// Thread-safe.
class DigestCheckedFolder : public format::ForwardingFolder {
 public:
  DigestCheckedFolder(const format::Folder& folder, const format::Manifest& manifest)
      : ForwardingFolder(folder), manifest_(manifest) {}

  std::shared_ptr<const format::ByteSource> Open(const std::string& name) const override;

  // The checks of the files opened since the last call, still to be finished: one for each file, however often it
  // was opened.
  std::vector<std::shared_ptr<FileDigestCheck>> TakeOpened() const;

 private:
  const format::Manifest& manifest_;
  mutable std::mutex mutex_;
  // By name; empty where it was taken.
  mutable std::map<std::string, std::shared_ptr<FileDigestCheck>> checks_;
};

}  // namespace vantrel::elastic::check
