#include "elastic/format/term_cursor.h"

#include <limits>
#include <utility>

#include "elastic/format/text.h"
#include "elastic/format/utf16_text.h"

namespace vantrel::elastic::format {
namespace {

// Format numbers, each named after what it brought.
constexpr int32_t kWithFormat = -1;
constexpr int32_t kWithSkipLevels = -3;
constexpr int32_t kWithUtf8Terms = -4;
static_assert(kWithUtf8Terms == TermCursor::kNewestFormat);

constexpr int32_t kNeverSkips = std::numeric_limits<int32_t>::max();
constexpr size_t kTermsBufferSize = size_t{64} << 10;

}  // namespace

TermCursor::TermCursor(std::shared_ptr<const ByteSource> source, File file, uint32_t field_count,
                       int32_t document_count)
    : reader_(std::move(source), kTermsBufferSize),
      file_(file),
      field_count_(field_count),
      document_count_(document_count) {
  ReadHeader();
}

void TermCursor::ReadHeader() {
  const int32_t first = reader_.ReadInt();
  if (first < kNewestFormat) {
    reader_.Damaged(0, "format is " + std::to_string(first) + ", but " + std::to_string(kNewestFormat) +
                           " is the newest known");
  }
  format_ = first < 0 ? first : 0;
  const uint64_t count_start = first < 0 ? reader_.offset() : 0;
  const int64_t count = first < 0 ? reader_.ReadLong() : first;
  index_interval_ = 128;
  skip_interval_ = kNeverSkips;
  const uint64_t intervals_start = reader_.offset();
  if (format_ < kWithFormat || (format_ == kWithFormat && file_ == File::kDictionary)) {
    index_interval_ = reader_.ReadInt();
    skip_interval_ = reader_.ReadInt();
  }
  if (format_ <= kWithSkipLevels) most_skip_levels_ = reader_.ReadInt();
  if (index_interval_ <= 0 || skip_interval_ <= 0) {
    reader_.Damaged(intervals_start, "index interval " + std::to_string(index_interval_) +
                                         " and skip interval " + std::to_string(skip_interval_) +
                                         " must both be above 0");
  }
  // Each term takes a byte at least for each of its numbers.
  const uint64_t shortest_term = file_ == File::kIndex ? 7 : 6;
  if (count < 0 || static_cast<uint64_t>(count) > reader_.remaining() / shortest_term) {
    reader_.Damaged(count_start, "term count " + std::to_string(count) + " does not fit a file of " +
                                     std::to_string(reader_.size()) + " bytes");
  }
  count_ = static_cast<uint64_t>(count);
}

bool TermCursor::is_utf8() const { return format_ <= kWithUtf8Terms; }

uint64_t TermCursor::index_entries() const {
  const auto interval = static_cast<uint64_t>(index_interval_);
  return count_ / interval + (count_ % interval != 0 ? 1 : 0);
}

bool TermCursor::index_repeats_skips() const { return format_ < kWithFormat; }

bool TermCursor::Next() {
  term_offset_ = reader_.offset();
  if (walked_ == count_) {
    if (reader_.remaining() == 0) return false;
    Damaged("terms end here, but the file goes on to " + std::to_string(reader_.size()));
  }
  is_utf8() ? ReadUtf8Text() : ReadUtf16Text();
  ReadField();
  ReadInfo();
  if (file_ == File::kIndex) dictionary_pointer_ = Advanced(dictionary_pointer_);
  ++walked_;
  return true;
}

void TermCursor::CopyPlace(TermPlace& place) const {
  place.field = field_;
  place.text = text_;
  place.units = units_;
  place.info = info_;
  place.dictionary_pointer = dictionary_pointer_;
}

void TermCursor::Resume(const TermPlace& place, uint64_t walked) {
  if (place.dictionary_pointer > reader_.size() || walked > count_) {
    reader_.Damaged(place.dictionary_pointer, "the index over this dictionary places term " +
                                                  std::to_string(walked) + " of " + std::to_string(count_) +
                                                  " here, in a file of " + std::to_string(reader_.size()) +
                                                  " bytes");
  }
  reader_.Seek(place.dictionary_pointer);
  walked_ = walked;
  field_ = place.field;
  text_ = place.text;
  units_ = place.units;
  text_is_stale_ = !is_utf8();
  info_ = place.info;
}

void TermCursor::ReadUtf8Text() {
  const uint32_t prefix = reader_.ReadVInt();
  const uint32_t suffix = reader_.ReadVInt();
  shared_length_ = prefix;
  if (prefix > text_.size()) {
    Damaged("term shares " + std::to_string(prefix) + " bytes with one of " + std::to_string(text_.size()));
  }
  const size_t length = size_t{prefix} + suffix;
  if (length > kLongestTerm) Damaged("term of " + std::to_string(length) + " bytes is too long");
  text_.resize(length);
  reader_.ReadBytes(std::span(reinterpret_cast<uint8_t*>(text_.data()) + prefix, suffix));
}

void TermCursor::ReadUtf16Text() {
  const uint32_t prefix = reader_.ReadVInt();
  const uint32_t suffix = reader_.ReadVInt();
  shared_length_ = prefix;
  if (prefix > units_.size()) {
    Damaged("term shares " + std::to_string(prefix) + " characters with one of " +
            std::to_string(units_.size()));
  }
  units_.resize(prefix);
  ReadUtf16Units(reader_, suffix, units_);
  text_is_stale_ = true;
}

void TermCursor::ConvertText() const {
  text_ = FromUtf16(units_);
  text_is_stale_ = false;
}

void TermCursor::ReadField() {
  field_ = static_cast<int32_t>(reader_.ReadVInt());
  if (field_ >= 0 && static_cast<uint32_t>(field_) < field_count_) return;
  if (field_ == -1 && file_ == File::kIndex && walked_ == 0) return;
  Damaged("term bears field number " + std::to_string(field_) + " of " + std::to_string(field_count_));
}

void TermCursor::ReadInfo() {
  const int32_t documents_before = info_.document_frequency;
  info_.document_frequency = static_cast<int32_t>(reader_.ReadVInt());
  // The index's first entry stands before all terms and has no documents.
  const int32_t fewest = file_ == File::kIndex && walked_ == 0 ? 0 : 1;
  if (info_.document_frequency < fewest || info_.document_frequency > document_count_) {
    Damaged("term is in " + std::to_string(info_.document_frequency) + " documents of " +
            std::to_string(document_count_));
  }
  const uint64_t postings_before = info_.postings_pointer;
  info_.postings_pointer = Advanced(postings_before);
  // A posting takes a byte at least. Terms that shared theirs could make a small file take forever.
  if (info_.postings_pointer - postings_before < static_cast<uint64_t>(documents_before)) {
    Damaged("postings of " + std::to_string(documents_before) + " documents take " +
            std::to_string(info_.postings_pointer - postings_before) + " bytes before this term's begin");
  }
  info_.positions_pointer = Advanced(info_.positions_pointer);
  info_.skip_offset = HasSkipOffset() ? reader_.ReadVInt() : 0;
}

bool TermCursor::HasSkipOffset() const {
  if (format_ != kWithFormat) return info_.document_frequency >= skip_interval_;
  // That layout's skip data is of no use any more, but its offset stands in the dictionary.
  return file_ == File::kDictionary && info_.document_frequency > skip_interval_;
}

uint64_t TermCursor::Advanced(uint64_t pointer) {
  const uint64_t delta = reader_.ReadVLong();
  if (delta > static_cast<uint64_t>(std::numeric_limits<int64_t>::max()) - pointer) {
    Damaged("pointer " + std::to_string(pointer) + " plus " + std::to_string(delta) +
            " does not fit 63 bits");
  }
  return pointer + delta;
}

std::optional<HeaderConflict> FindHeaderConflict(const TermCursor& dictionary, const TermCursor& index) {
  std::optional<HeaderConflict> conflict;
  const auto compare = [&](const char* what, int64_t in_dictionary, int64_t in_index) {
    if (!conflict.has_value() && in_dictionary != in_index) conflict = {what, in_dictionary, in_index};
  };
  compare("format", dictionary.format(), index.format());
  if (dictionary.index_repeats_skips()) {
    compare("index interval", dictionary.index_interval(), index.index_interval());
    compare("skip interval", dictionary.skip_interval(), index.skip_interval());
    compare("number of skip levels", dictionary.most_skip_levels(), index.most_skip_levels());
  }
  // A count is below the size of its file.
  compare("number of entries", static_cast<int64_t>(dictionary.index_entries()),
          static_cast<int64_t>(index.count()));
  return conflict;
}

}  // namespace vantrel::elastic::format
