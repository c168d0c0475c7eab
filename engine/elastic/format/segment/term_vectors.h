#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/term_text.h"

namespace vantrel::elastic::format {

// The term vectors of documents: an index (.tvx) of pointers, the fields of each document (.tvd), and the terms of
// each of those fields (.tvf). Layout, by format F (4 is written today, and every file begins with Int F; the
// oldest known is 1):
//
//   .tvx  for each document: Long where it begins in .tvd;  F >= 3: Long where its first field begins in .tvf
//   .tvd  for each document, without gaps: VInt count of fields, a VInt field number each (F = 1: from the one
//         before), then, where there are any
//     F < 3: VLong where the first field begins in .tvf
//     for each field but the first: VLong how many bytes the one before takes in .tvf
//   .tvf  for each field of each document, without gaps: VInt count of terms, 1 or more
//     F >= 2: Byte flags (1 positions, 2 offsets);  F = 1: a VInt of no meaning
//     for each term, in ascending order (term_order.h)
//       VInt prefix shared with the term before, VInt length of what follows, that text (TermText)
//       VInt frequency
//       with positions: that many VInts, each the distance from the one before; the first may be -1
//       with offsets: that many times VInt distance of the start from the end before (may be negative), VInt length
//
// For one thread at a time.
class TermVectorsReader {
 public:
  static constexpr uint8_t kPositions = 1;
  static constexpr uint8_t kOffsets = 2;

  // A document's field.
  struct Field {
    uint32_t number;
    uint64_t offset;  // of the number in .tvd
  };

  // The headers are read and checked; `field_count` is the segment's. Throws IndexDamagedError, IndexIoError, as
  // does everything below.
  TermVectorsReader(std::shared_ptr<const ByteSource> index, std::shared_ptr<const ByteSource> documents,
                    std::shared_ptr<const ByteSource> fields, uint32_t field_count);

  // Whether .tvx tells where a document's first field begins in .tvf, be there one or not.
  bool index_tells_terms_start() const;
  uint64_t documents() const { return (index_.size() - kHeader) / entry_size_; }
  const ByteReader& index() const { return index_; }
  const ByteReader& document_list() const { return documents_; }
  const ByteReader& terms() const { return fields_; }

  // Where a document's pointers stand in the index, and where the lists begin without any document.
  uint64_t PointerOffset(uint64_t document) const { return kHeader + document * entry_size_; }
  static constexpr uint64_t header_size() { return kHeader; }

  // Reads a document's list of fields; `document` must be below documents(). No field number is repeated or reaches
  // the segment's count, and no more memory is taken than that count justifies.
  void Seek(uint64_t document);
  const std::vector<Field>& fields() const { return list_; }
  uint64_t list_start() const { return list_start_; }
  uint64_t list_end() const { return documents_.offset(); }
  // Where the first field begins in .tvf; without fields, where it would (F >= 3), or 0.
  uint64_t terms_start() const { return terms_start_; }
  // Where a field begins; `field` counts from 0 in fields().
  uint64_t TermsStart(size_t field) const { return terms_starts_[field]; }

  // Moves to a field's terms and reads their header.
  void SeekTerms(size_t field);
  uint8_t flags() const { return flags_; }

  // Moves past all terms of the field. They must ascend, be valid, and hold as many positions and offsets as
  // announced. Takes time in proportion to the bytes that are read, however long the texts are that terms share.
  void PassTerms();
  // About how much memory the index library takes for the field that PassTerms() has passed: it keeps the texts as a
  // whole, however much they share in the file, and an object for each pair of offsets.
  uint64_t LibraryMemory() const;
  uint64_t terms_end() const { return fields_.offset(); }

 private:
  static constexpr uint64_t kHeader = 4;

  void ReadFieldNumbers(uint32_t count);
  void ReadTermsStarts();
  void ReadTerm();
  void PassPlaces(uint32_t frequency);

  ByteReader index_;
  ByteReader documents_;
  ByteReader fields_;
  uint32_t field_count_;
  int32_t format_ = 0;
  uint64_t entry_size_ = 16;

  std::vector<Field> list_;
  std::vector<uint64_t> terms_starts_;
  std::vector<uint64_t> seen_in_;  // by field number: the serial number of the last list that held it
  uint64_t lists_read_ = 0;
  uint64_t list_start_ = 0;
  uint64_t terms_start_ = 0;

  uint32_t term_count_ = 0;
  uint8_t flags_ = 0;
  bool at_first_ = true;
  // Passed of the field.
  uint64_t terms_passed_ = 0;
  uint64_t text_passed_ = 0;
  uint64_t occurrences_passed_ = 0;
  TermText text_{true};
  OrderOfTerms order_{true};
};

}  // namespace vantrel::elastic::format
