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
// then the term's skip data, if it has any. For one thread at a time.
class PostingsReader {
 public:
  PostingsReader(std::shared_ptr<const ByteSource> source, int32_t document_count);

  // Moves before the first document of a term. Throws IndexDamagedError, IndexIoError, as does Next().
  void Seek(const TermInfo& term, bool omits_frequencies);

  // Moves to the next document; false at the end. Whatever the bytes, documents ascend and lie in the
  // segment.
  bool Next();

  int32_t document() const { return document_; }
  uint32_t frequency() const { return frequency_; }

 private:
  ByteReader reader_;
  uint32_t document_count_;
  bool omits_frequencies_ = false;
  int32_t left_ = 0;
  bool at_first_ = true;
  int32_t document_ = 0;
  uint32_t frequency_ = 0;
};

}  // namespace vantrel::elastic::format
