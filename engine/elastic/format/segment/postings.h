#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <memory>
#include <span>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/term_cursor.h"

namespace vantrel::elastic::format {

// The documents of a term (.frq). Layout, at the term's postings pointer, for each document in ascending
// order:
//
//   VInt twice the distance from the document before (the first: from 0), plus 1 where the frequency is 1
//   else VInt frequency
//   where the field omits frequencies: VInt the distance alone
//
// then the term's skip data, if it has any (skip_list.h). For one thread at a time.
class PostingsReader {
 public:
  PostingsReader(std::shared_ptr<const ByteSource> source, int32_t document_count,
                 size_t buffer_size = ByteReader::kDefaultBufferSize);

  // Moves before the first document of a term. Throws IndexDamagedError, IndexIoError, as does Next().
  void Seek(const TermInfo& term, bool omits_frequencies);

  // Moves behind some of a term's documents, as its skip data tell: to `pointer`, where the next one begins, with
  // `document` the one before, and `left` to come.
  void Resume(uint64_t pointer, int32_t document, int32_t left, bool omits_frequencies);

  // Moves to the next document; false at the end. Whatever the bytes, documents ascend and lie in the
  // segment.
  bool Next() {
    if (left_ == 0) return false;
    start_ = reader_.offset();
    const uint32_t code = reader_.ReadVInt();
    const uint32_t distance = omits_frequencies_ ? code : code >> 1;
    const bool once = omits_frequencies_ || (code & 1) != 0;
    frequency_ = once ? 1 : reader_.ReadVInt();
    const auto before = static_cast<uint32_t>(document_);
    if ((distance == 0 && !at_first_) || distance >= document_count_ - before || frequency_ == 0) {
      Refuse(distance);
    }
    document_ = static_cast<int32_t>(before + distance);
    at_first_ = false;
    --left_;
    return true;
  }

  // Moves past that many documents at once, as Next() would, of those that are left; at most kLongestBlock. Then
  // frequency() says nothing.
  void PassBlock(int32_t count);
  static constexpr int32_t kLongestBlock = 128;

  // The sum of the frequencies in the block, and a number that none of them exceeds.
  uint64_t block_occurrences() const { return block_occurrences_; }
  uint32_t block_bound() const { return block_bound_; }
  // The frequencies in the block. May read the block again. Throws like Next().
  std::span<const uint32_t> BlockFrequencies();

  int32_t document() const { return document_; }
  uint32_t frequency() const { return frequency_; }

  // Fills the buffer with the next bytes, as many of these as fit it.
  void ReadAhead(size_t bytes) { reader_.Window(std::min(bytes, reader_.buffer_size())); }
  // For a reader of the same source to borrow from.
  const ByteReader& reader() const { return reader_; }

  // Where the next document begins, or what follows the last one.
  uint64_t offset() const { return reader_.offset(); }
  uint64_t size() const { return reader_.size(); }
  const std::string& name() const { return reader_.name(); }

 private:
  [[noreturn]] void Refuse(uint32_t distance) const;
  int32_t PassWide(int32_t count);
  template <bool kOmitsFrequencies>
  bool PassQuickly(int32_t count);
  void PassOneByOne(int32_t count);

  ByteReader reader_;
  uint32_t document_count_;
  bool omits_frequencies_ = false;
  int32_t left_ = 0;
  bool at_first_ = true;
  int32_t document_ = 0;
  uint32_t frequency_ = 0;
  uint64_t start_ = 0;

  // Of the block.
  struct Place {
    uint64_t offset = 0;
    int32_t left = 0;
    bool at_first = true;
    int32_t document = 0;
  };
  Place block_start_;
  bool knows_frequencies_ = false;
  std::array<uint32_t, kLongestBlock> frequencies_{};
  int32_t block_count_ = 0;
  uint64_t block_occurrences_ = 0;
  uint32_t block_bound_ = 0;
};

}  // namespace vantrel::elastic::format
