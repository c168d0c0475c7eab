#pragma once

#include <cstdint>
#include <memory>

#include "elastic/format/byte_reader.h"
#include "elastic/format/byte_source.h"

namespace vantrel::elastic::format {

// The stored fields of documents: an index (.fdx) of pointers into the records (.fdt). Layout, by format F (2 is
// written today; the oldest, 0, has no Int F in either file):
//
//   .fdx  Int F, then for each document: Long where its record begins
//   .fdt  Int F, then for each document, without gaps:
//     VInt count of fields, then for each
//       VInt field number, Byte flags (1 cut into words, 2 binary, 4 compressed: F < 2 only)
//       binary or compressed: VInt length, so many bytes (compressed: a zlib stream)
//       else F >= 1: String;  F = 0: VInt count of UTF-16 code units, those (text.h)
//
// For one thread at a time.
class StoredFieldsReader {
 public:
  static constexpr uint8_t kCut = 1;
  static constexpr uint8_t kBinary = 2;
  static constexpr uint8_t kCompressed = 4;

  // The headers are read and checked. Throws IndexDamagedError, IndexIoError, as does everything below.
  StoredFieldsReader(std::shared_ptr<const ByteSource> index, std::shared_ptr<const ByteSource> records);

  uint64_t documents() const { return (index_.size() - header_) / kPointerSize; }
  uint64_t header_size() const { return header_; }
  const ByteReader& index() const { return index_; }
  const ByteReader& records() const { return records_; }

  // Where a document's pointer stands in the index.
  uint64_t PointerOffset(uint64_t document) const { return header_ + document * kPointerSize; }

  // Moves before the first field of a document's record; `document` must be below documents(). Ends and
  // beginnings of records lie within the file and ascend.
  void Seek(uint64_t document);
  uint64_t start() const { return start_; }
  uint64_t end() const { return end_; }  // where the next record begins

  // Moves to the next field, and reads what stands before its value; false after the last one. The value of
  // the field before must have been passed.
  bool Next();
  uint64_t field_offset() const { return field_offset_; }
  uint32_t number() const { return number_; }
  uint8_t flags() const { return flags_; }
  uint8_t known_flags() const;  // those that the format has

  // Moves past the value. It must lie within the record, be valid UTF-8 where it is text, and whole where it is
  // compressed.
  void PassValue();

 private:
  static constexpr uint64_t kPointerSize = 8;

  uint64_t ReadPointer(uint64_t document);
  void PassText(uint64_t start, uint64_t length);
  void PassUtf16(uint64_t start, uint64_t count);
  void PassCompressed(uint64_t start, uint64_t length);

  ByteReader index_;
  ByteReader records_;
  int32_t format_ = 0;
  uint64_t header_ = 0;
  uint64_t start_ = 0;
  uint64_t end_ = 0;
  uint32_t fields_left_ = 0;
  uint64_t field_offset_ = 0;
  uint32_t number_ = 0;
  uint8_t flags_ = 0;
};

}  // namespace vantrel::elastic::format
