#pragma once

#include <cstdint>
#include <memory>

#include "elastic/format/byte_reader.h"
#include "elastic/format/byte_source.h"
#include "elastic/format/term_cursor.h"

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

  int32_t document() const { return document_; }
  uint32_t frequency() const { return frequency_; }

  // Where the document at the cursor begins, and where the next one does, or what follows the last one.
  uint64_t start() const { return start_; }
  uint64_t offset() const { return reader_.offset(); }
  uint64_t size() const { return reader_.size(); }
  const std::string& name() const { return reader_.name(); }

 private:
  [[noreturn]] void Refuse(uint32_t distance) const;

  ByteReader reader_;
  uint32_t document_count_;
  bool omits_frequencies_ = false;
  int32_t left_ = 0;
  bool at_first_ = true;
  int32_t document_ = 0;
  uint32_t frequency_ = 0;
  uint64_t start_ = 0;
};

}  // namespace vantrel::elastic::format
