#pragma once

#include <cstdint>
#include <memory>
#include <optional>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/inflate.h"

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

  // The longest that a compressed value may become, in bytes. The index library inflates it into memory, and takes
  // five times as much for a text.
  static constexpr uint64_t kLongestInflated = uint64_t{16} << 20;
  // All compressed values that a reader has passed may become kMostInflation times their compressed size, and
  // kFreelyInflated bytes beyond. So the time that a file takes is bounded by its size, and that of small
  // files in many segments by the number of segments.
  static constexpr uint64_t kMostInflation = 32;
  static constexpr uint64_t kFreelyInflated = uint64_t{1} << 20;

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

  // Moves past the value. It must lie within the record, be valid UTF-8 where it is text, and where it is compressed
  // be whole and inflate within the bounds above. It is not held in memory.
  void PassValue();

 private:
  static constexpr uint64_t kPointerSize = 8;

  uint64_t ReadPointer(uint64_t document);
  void PassText(uint64_t start, uint64_t length);
  void PassUtf16(uint64_t start, uint64_t count);
  void PassCompressed(uint64_t start, uint64_t length);
  void RequireWithinBounds(uint64_t start, uint64_t value_size) const;

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

  std::optional<Inflater> inflater_;  // made for the first compressed value
  uint64_t compressed_ = 0;           // bytes of compressed values that were read
  uint64_t inflated_ = 0;             // bytes that they became
};

}  // namespace vantrel::elastic::format
