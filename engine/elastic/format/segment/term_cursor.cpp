#include "elastic/format/segment/term_cursor.h"

#include <limits>
#include <span>
#include <utility>

#include "elastic/common/text.h"

namespace vantrel::elastic::format {
namespace {

// Format numbers, each named after what it brought.
constexpr int32_t kWithFormat = -1;
constexpr int32_t kWithSkipLevels = -3;
constexpr int32_t kWithUtf8Terms = -4;
static_assert(kWithUtf8Terms == TermCursor::kNewestFormat);

constexpr int32_t kNeverSkips = std::numeric_limits<int32_t>::max();

constexpr uint64_t kLargestPointer = std::numeric_limits<int64_t>::max();

// The most bytes that a term's numbers take, before its text and behind it.
constexpr size_t kLengths = size_t{2} * 5;
constexpr size_t kNumbers = 3 * 5 + 3 * 9;

// Decodes numbers that lie within a window. What is not well-formed is left to the reader, which reports it.
class WindowDecoder {
 public:
  explicit WindowDecoder(const uint8_t* next) : next_(next) {}

  const uint8_t* next() const { return next_; }
  void Skip(size_t length) { next_ += length; }
  bool ok() const { return ok_; }

  uint32_t VInt() {
    const uint64_t value = Variable(5);
    if (value > std::numeric_limits<uint32_t>::max()) ok_ = false;
    return static_cast<uint32_t>(value);
  }
  uint64_t VLong() { return Variable(9); }

 private:
  uint64_t Variable(int most_bytes) {
    const uint8_t first = *next_++;
    if (first < 0x80) return first;
    uint64_t value = first & 0x7fU;
    for (int shift = 7; shift < 7 * most_bytes; shift += 7) {
      const uint8_t byte = *next_++;
      value |= uint64_t{byte & 0x7fU} << shift;
      if (byte < 0x80) return value;
    }
    ok_ = false;
    return value;
  }

  const uint8_t* next_;
  bool ok_ = true;
};

}  // namespace

TermCursor::TermCursor(std::shared_ptr<const ByteSource> source, File file, uint32_t field_count,
                       int32_t document_count, size_t buffer_size)
    : reader_(std::move(source), buffer_size),
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
  text_ = TermText(is_utf8());
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
  field_before_ = field_;
  if (is_utf8() && NextFromWindow()) return true;
  text_.Read(reader_, term_offset_);
  ReadField();
  ReadInfo();
  if (file_ == File::kIndex) dictionary_pointer_ = Advanced(dictionary_pointer_);
  ++walked_;
  return true;
}

// The same as the rest of Next(), for a term that lies in the reader's buffer with some bytes behind it, and is not
// damaged; else false, and nothing has changed.
bool TermCursor::NextFromWindow() {
  const std::span<const uint8_t> window = reader_.Window(4 * (kLengths + kNumbers));
  if (window.size() < kLengths + kNumbers) return false;
  WindowDecoder decoder(window.data());
  const uint32_t prefix = decoder.VInt();
  const uint32_t suffix = decoder.VInt();
  if (!decoder.ok() || prefix > text_.text().size() || size_t{prefix} + suffix > kLongestTerm ||
      window.size() < kLengths + suffix + kNumbers) {
    return false;
  }
  const uint8_t* const text = decoder.next();
  decoder.Skip(suffix);
  const auto field = static_cast<int32_t>(decoder.VInt());
  const auto documents = static_cast<int32_t>(decoder.VInt());
  const uint64_t postings = decoder.VLong();
  const uint64_t positions = decoder.VLong();
  const uint32_t skip_offset = HasSkipOffset(documents) ? decoder.VInt() : 0;
  const uint64_t pointer = file_ == File::kIndex ? decoder.VLong() : 0;
  if (!decoder.ok() || !IsField(field) || documents < FewestDocuments() || documents > document_count_ ||
      postings < static_cast<uint64_t>(info_.document_frequency) ||
      postings > kLargestPointer - info_.postings_pointer ||
      positions > kLargestPointer - info_.positions_pointer ||
      pointer > kLargestPointer - dictionary_pointer_) {
    return false;
  }
  text_.TakeNext(prefix, text, suffix);
  field_ = field;
  info_ = {documents, info_.postings_pointer + postings, info_.positions_pointer + positions, skip_offset};
  dictionary_pointer_ += pointer;
  reader_.Advance(static_cast<size_t>(decoder.next() - window.data()));
  ++walked_;
  return true;
}

void TermCursor::UpdateCopy(TermPlace& place) const {
  place.field = field_;
  text_.UpdateCopy(place.text);
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
  text_.Assign(place.text);
  info_ = place.info;
}

void TermCursor::ReadField() {
  field_ = static_cast<int32_t>(reader_.ReadVInt());
  if (IsField(field_)) return;
  Damaged("term bears field number " + std::to_string(field_) + " of " + std::to_string(field_count_));
}

bool TermCursor::IsField(int32_t field) const {
  if (field >= 0) return static_cast<uint32_t>(field) < field_count_;
  return field == -1 && file_ == File::kIndex && walked_ == 0;
}

void TermCursor::ReadInfo() {
  const int32_t documents_before = info_.document_frequency;
  info_.document_frequency = static_cast<int32_t>(reader_.ReadVInt());
  // The index's first entry stands before all terms and has no documents.
  if (info_.document_frequency < FewestDocuments() || info_.document_frequency > document_count_) {
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
  info_.skip_offset = HasSkipOffset(info_.document_frequency) ? reader_.ReadVInt() : 0;
}

bool TermCursor::HasSkipOffset(int32_t document_frequency) const {
  if (format_ != kWithFormat) return document_frequency >= skip_interval_;
  // That layout's skip data is of no use any more, but its offset stands in the dictionary.
  return file_ == File::kDictionary && document_frequency > skip_interval_;
}

uint64_t TermCursor::Advanced(uint64_t pointer) {
  const uint64_t delta = reader_.ReadVLong();
  if (delta > kLargestPointer - pointer) {
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
