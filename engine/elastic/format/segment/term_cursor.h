#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/term_text.h"

namespace vantrel::elastic::format {

// Where a term's postings stand.
struct TermInfo {
  int32_t document_frequency = 0;
  uint64_t postings_pointer = 0;   // into .frq
  uint64_t positions_pointer = 0;  // into .prx
  uint32_t skip_offset = 0;        // of the skip data, from postings_pointer; 0 where the term has none
};

// A place in a dictionary, as the index over it tells: behind a term, whose numbers and text the next one builds on.
struct TermPlace {
  int32_t field = -1;
  RawText text;
  TermInfo info;
  uint64_t dictionary_pointer = 0;  // where the next term begins
};

// Walks a term dictionary (.tis) or the index over it (.tii), which holds every n-th term of the dictionary.
// Memory does not grow with the number of terms, and a walk takes time in proportion to the bytes of the file, however
// long the texts are that its terms share (TermText). For one thread at a time. Layout, by format F (the newer the
// smaller; -4 is written today):
//
//   Int F                 absent when the first Int is 0 or more: the oldest layout, and that is the count
//   Long count of terms
//   Int index interval, Int skip interval    F = -1: in .tis only, and the second means something else
//   F <= -3: Int most skip levels            before: 1
//   then for each term
//     VInt prefix shared with the term before, VInt length of what follows, that text (TermText)
//     VInt field number     in .tii the first term is empty and bears field number -1
//     VInt document frequency, VLong postings pointer, VLong positions pointer (both from the term before)
//     VInt offset of skip data, where the document frequency reaches the skip interval
//     in .tii: VLong pointer into .tis, from the term before
class TermCursor {
 public:
  enum class File { kDictionary, kIndex };

  static constexpr int32_t kNewestFormat = -4;
  static constexpr size_t kDefaultBufferSize = size_t{64} << 10;

  // The header is read and checked. `field_count` and `document_count` are the segment's. Throws
  // IndexDamagedError, IndexIoError, as does Next().
  TermCursor(std::shared_ptr<const ByteSource> source, File file, uint32_t field_count,
             int32_t document_count, size_t buffer_size = kDefaultBufferSize);

  // How many terms the file holds. Checked against the file's size, not by walking.
  uint64_t count() const { return count_; }
  int32_t index_interval() const { return index_interval_; }
  int32_t skip_interval() const { return skip_interval_; }
  bool is_utf8() const;  // the layout of today, sorted by bytes
  int32_t most_skip_levels() const { return most_skip_levels_; }
  int32_t format() const { return format_; }  // 0 for the oldest layout
  const std::string& name() const { return reader_.name(); }

  // How many entries the index over this dictionary has, and whether in this layout it repeats the intervals and
  // the skip offsets of the dictionary.
  uint64_t index_entries() const;
  bool index_repeats_skips() const;

  // Moves to the next term, at first to the first one; false at the end. At the end it is checked that the
  // file ends there too.
  bool Next();

  // The term at the cursor, while Next() has returned true last; before the first term and behind a place to go on from,
  // that place.
  int32_t field() const { return field_; }
  // The bytes of the file: UTF-8 if undamaged. Valid until Next().
  std::string_view text() const { return text_.text(); }
  // What the text has in common with the one before, and how it compares with it.
  const TermText& term_text() const { return text_; }
  bool HasValidText() { return text_.IsValid(); }
  bool HasKeptText() { return text_.IsKept(); }
  // The field of the term before, -1 before the first one.
  int32_t field_before() const { return field_before_; }
  const TermInfo& info() const { return info_; }
  uint64_t dictionary_pointer() const { return dictionary_pointer_; }  // in .tii only

  // Makes a copy of the place that the entry at the cursor tells, out of a copy of that of the entry before; at the
  // first entry, out of an empty one. In .tii only.
  void UpdateCopy(TermPlace& place) const;

  // Moves to a place in this dictionary, behind the first `walked` of its terms; Next() goes on from there. Throws
  // IndexDamagedError where the dictionary has no such place. A place that lies between terms by mistake shows as
  // damage or as wrong terms, as wrong bytes of a dictionary do.
  void Resume(const TermPlace& place, uint64_t walked);

  // Where the term at the cursor begins, and where it ends.
  uint64_t offset() const { return term_offset_; }
  uint64_t end_offset() const { return reader_.offset(); }
  // Throws IndexDamagedError about the term at the cursor, or about what follows it.
  [[noreturn]] void Damaged(const std::string& problem) const { reader_.Damaged(term_offset_, problem); }
  [[noreturn]] void DamagedBehind(const std::string& problem) const {
    reader_.Damaged(reader_.offset(), problem);
  }

 private:
  void ReadHeader();
  bool NextFromWindow();
  void ReadField();
  void ReadInfo();
  bool IsField(int32_t field) const;
  bool HasSkipOffset(int32_t document_frequency) const;
  int32_t FewestDocuments() const { return file_ == File::kIndex && walked_ == 0 ? 0 : 1; }
  uint64_t Advanced(uint64_t pointer);

  ByteReader reader_;
  File file_;
  uint32_t field_count_;
  int32_t document_count_;

  int32_t format_ = 0;
  uint64_t count_ = 0;
  int32_t index_interval_ = 0;
  int32_t skip_interval_ = 0;
  int32_t most_skip_levels_ = 1;

  uint64_t walked_ = 0;
  uint64_t term_offset_ = 0;
  int32_t field_ = -1;
  int32_t field_before_ = -1;
  TermText text_{true};
  TermInfo info_;
  uint64_t dictionary_pointer_ = 0;
};

// What the header of an index over a dictionary tells otherwise than the dictionary's own.
struct HeaderConflict {
  const char* what;
  int64_t in_dictionary;
  int64_t in_index;
};
std::optional<HeaderConflict> FindHeaderConflict(const TermCursor& dictionary, const TermCursor& index);

}  // namespace vantrel::elastic::format
