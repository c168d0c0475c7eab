#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "elastic/format/byte_reader.h"
#include "elastic/format/byte_source.h"

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
  std::string text;      // in the layout of today,
  std::u16string units;  // or in the older ones
  TermInfo info;
  uint64_t dictionary_pointer = 0;  // where the next term begins
};

// Walks a term dictionary (.tis) or the index over it (.tii), which holds every n-th term of the dictionary.
// Memory does not grow with the number of terms. For one thread at a time. Layout, by format F (the newer the
// smaller; -4 is written today):
//
//   Int F                 absent when the first Int is 0 or more: the oldest layout, and that is the count
//   Long count of terms
//   Int index interval, Int skip interval    F = -1: in .tis only, and the second means something else
//   F <= -3: Int most skip levels            before: 1
//   then for each term
//     VInt prefix shared with the term before, VInt length of what follows, that text
//       (F = -4: in bytes, UTF-8; before: in UTF-16 code units, see text.h)
//     VInt field number     in .tii the first term is empty and bears field number -1
//     VInt document frequency, VLong postings pointer, VLong positions pointer (both from the term before)
//     VInt offset of skip data, where the document frequency reaches the skip interval
//     in .tii: VLong pointer into .tis, from the term before
class TermCursor {
 public:
  enum class File { kDictionary, kIndex };

  static constexpr int32_t kNewestFormat = -4;

  // The header is read and checked. `field_count` and `document_count` are the segment's. Throws
  // IndexDamagedError, IndexIoError, as does Next().
  TermCursor(std::shared_ptr<const ByteSource> source, File file, uint32_t field_count,
             int32_t document_count);

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

  // The term at the cursor, while Next() has returned true last.
  int32_t field() const { return field_; }
  // The bytes of the file: UTF-8 if undamaged. Valid until Next().
  std::string_view text() const {
    if (text_is_stale_) ConvertText();
    return text_;
  }
  const TermInfo& info() const { return info_; }
  // How much of its text it takes from the term before, in bytes or, in the older layouts, UTF-16 units.
  uint32_t shared_length() const { return shared_length_; }
  uint64_t dictionary_pointer() const { return dictionary_pointer_; }  // in .tii only

  // Copies the place that the entry at the cursor tells; in .tii only.
  void CopyPlace(TermPlace& place) const;

  // Moves to a place in this dictionary, behind the first `walked` of its terms; Next() goes on from there. Throws
  // IndexDamagedError where the dictionary has no such place. A place that lies between terms by mistake shows as
  // damage or as wrong terms, as wrong bytes of a dictionary do.
  void Resume(const TermPlace& place, uint64_t walked);

  // Where the term at the cursor begins, and throws IndexDamagedError about it.
  uint64_t offset() const { return term_offset_; }
  [[noreturn]] void Damaged(const std::string& problem) const { reader_.Damaged(term_offset_, problem); }

 private:
  void ReadHeader();
  void ReadUtf8Text();
  void ReadUtf16Text();
  void ConvertText() const;
  void ReadField();
  void ReadInfo();
  bool HasSkipOffset() const;
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
  uint32_t shared_length_ = 0;
  mutable std::string text_;
  std::u16string units_;  // the text of the older layouts, which is converted only when it is asked for
  mutable bool text_is_stale_ = false;
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
