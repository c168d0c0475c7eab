#include "elastic/format/segment/term_vectors.h"

#include <limits>
#include <utility>

namespace vantrel::elastic::format {
namespace {

// Format numbers, each named after what it brought.
constexpr int32_t kOldest = 1;
constexpr int32_t kWithFlags = 2;
constexpr int32_t kWithTermsPointer = 3;
constexpr int32_t kWithUtf8Vectors = 4;

constexpr size_t kVectorIndexBufferSize = size_t{64} << 10;
constexpr size_t kVectorListBufferSize = size_t{64} << 10;
constexpr size_t kVectorTermsBufferSize = size_t{128} << 10;

}  // namespace

TermVectorsReader::TermVectorsReader(std::shared_ptr<const ByteSource> index,
                                     std::shared_ptr<const ByteSource> documents,
                                     std::shared_ptr<const ByteSource> fields, uint32_t field_count)
    : index_(std::move(index), kVectorIndexBufferSize),
      documents_(std::move(documents), kVectorListBufferSize),
      fields_(std::move(fields), kVectorTermsBufferSize),
      field_count_(field_count),
      seen_in_(field_count) {
  format_ = index_.ReadInt();
  if (format_ < kOldest || format_ > kWithUtf8Vectors) {
    index_.Damaged(0, "format is " + std::to_string(format_) + ", but 1 to 4 are known");
  }
  for (ByteReader* reader : {&documents_, &fields_}) {
    const int32_t again = reader->ReadInt();
    if (again != format_) {
      reader->Damaged(
          0, "format is " + std::to_string(again) + ", but the index has format " + std::to_string(format_));
    }
  }
  text_ = TermText(format_ >= kWithUtf8Vectors);
  order_ = OrderOfTerms(format_ >= kWithUtf8Vectors);
  entry_size_ = index_tells_terms_start() ? 16 : 8;
  if ((index_.size() - kHeader) % entry_size_ != 0) {
    index_.Damaged(index_.size(), "the file ends within an entry");
  }
}

bool TermVectorsReader::index_tells_terms_start() const { return format_ >= kWithTermsPointer; }

void TermVectorsReader::Seek(uint64_t document) {
  index_.Seek(PointerOffset(document));
  const auto pointer = static_cast<uint64_t>(index_.ReadLong());
  if (pointer < kHeader || pointer >= documents_.size()) {
    index_.Damaged(PointerOffset(document), "pointer is " + std::to_string(static_cast<int64_t>(pointer)) +
                                                ", but the documents' fields end at " +
                                                std::to_string(documents_.size()));
  }
  terms_start_ = index_tells_terms_start() ? static_cast<uint64_t>(index_.ReadLong()) : 0;
  list_start_ = pointer;
  documents_.Seek(pointer);
  const uint32_t count = documents_.ReadVInt();
  if (count > field_count_) {
    documents_.Damaged(pointer, "document has vectors of " + std::to_string(count) + " fields of " +
                                    std::to_string(field_count_));
  }
  ReadFieldNumbers(count);
  ReadTermsStarts();
}

void TermVectorsReader::ReadFieldNumbers(uint32_t count) {
  list_.clear();
  ++lists_read_;
  uint32_t number = 0;
  for (; count > 0; --count) {
    const uint64_t start = documents_.offset();
    const uint32_t code = documents_.ReadVInt();
    number = format_ >= kWithFlags ? code : number + code;
    if (number >= field_count_ || seen_in_[number] == lists_read_) {
      documents_.Damaged(start, "field number " + std::to_string(number) + " of " +
                                    std::to_string(field_count_) + " is repeated or too large");
    }
    seen_in_[number] = lists_read_;
    list_.push_back({number, start});
  }
}

void TermVectorsReader::ReadTermsStarts() {
  terms_starts_.clear();
  if (list_.empty()) return;
  if (!index_tells_terms_start()) terms_start_ = documents_.ReadVLong();
  uint64_t start = terms_start_;
  for (size_t i = 0; i < list_.size(); ++i) {
    const uint64_t offset = documents_.offset();
    const uint64_t distance = i > 0 ? documents_.ReadVLong() : 0;
    if (start >= fields_.size() || distance >= fields_.size() - start) {
      documents_.Damaged(offset, "terms begin at " + std::to_string(static_cast<int64_t>(start)) + " plus " +
                                     std::to_string(distance) + ", but end at " +
                                     std::to_string(fields_.size()));
    }
    start += distance;
    terms_starts_.push_back(start);
  }
}

void TermVectorsReader::SeekTerms(size_t field) {
  fields_.Seek(terms_starts_[field]);
  const uint64_t start = fields_.offset();
  term_count_ = fields_.ReadVInt();
  // A term takes three bytes at least.
  if (term_count_ == 0 || term_count_ > fields_.remaining() / 3) {
    fields_.Damaged(start, "vector of " + std::to_string(term_count_) + " terms, but the file ends at " +
                               std::to_string(fields_.size()));
  }
  flags_ = 0;
  if (format_ >= kWithFlags) {
    flags_ = fields_.ReadByte();
  } else {
    fields_.ReadVInt();
  }
}

void TermVectorsReader::PassTerms() {
  text_.Clear();
  at_first_ = true;
  terms_passed_ = term_count_;
  text_passed_ = occurrences_passed_ = 0;
  for (; term_count_ > 0; --term_count_) ReadTerm();
}

uint64_t TermVectorsReader::LibraryMemory() const {
  constexpr uint64_t kPerTerm = 128;
  constexpr uint64_t kPerCharacter = 4;
  constexpr uint64_t kPerPosition = 8;
  constexpr uint64_t kPerOffsets = 96;
  const uint64_t per_occurrence =
      ((flags_ & kPositions) != 0 ? kPerPosition : 0) + ((flags_ & kOffsets) != 0 ? kPerOffsets : 0);
  return terms_passed_ * kPerTerm + text_passed_ * kPerCharacter + occurrences_passed_ * per_occurrence;
}

void TermVectorsReader::ReadTerm() {
  const uint64_t start = fields_.offset();
  text_.Read(fields_, start);
  if (!text_.IsValid()) fields_.Damaged(start, "term is not valid UTF-8");
  if (!at_first_ && !order_.Take(text_.ascends_by()))
    fields_.Damaged(start, "term does not come after the one before");
  at_first_ = false;
  const uint64_t frequency_start = fields_.offset();
  const uint32_t frequency = fields_.ReadVInt();
  if (frequency == 0 || frequency > static_cast<uint32_t>(std::numeric_limits<int32_t>::max())) {
    fields_.Damaged(frequency_start, "frequency is " + std::to_string(static_cast<int32_t>(frequency)));
  }
  text_passed_ += text_.text().size();
  occurrences_passed_ += frequency;
  if (flags_ != 0) PassPlaces(frequency);
}

void TermVectorsReader::PassPlaces(uint32_t frequency) {
  // Distances of three bytes are below 2^21: so few of them neither wrap nor descend.
  constexpr uint32_t kFew = 1 << 10;
  const uint64_t numbers = ((flags_ & kPositions) != 0 ? 1U : 0U) + ((flags_ & kOffsets) != 0 ? 2U : 0U);
  const uint64_t places_start = fields_.offset();
  if (frequency < kFew && fields_.PassShortVInts(numbers * frequency)) return;
  fields_.Seek(places_start);
  if ((flags_ & kPositions) != 0) {
    int32_t position = 0;
    int32_t least = -1;
    for (uint32_t left = frequency; left > 0; --left) {
      const uint64_t start = fields_.offset();
      position = static_cast<int32_t>(static_cast<uint32_t>(position) + fields_.ReadVInt());
      if (position < least) {
        fields_.Damaged(start, "position " + std::to_string(position) + " follows " + std::to_string(least));
      }
      least = position;
    }
  }
  if ((flags_ & kOffsets) != 0) {
    for (uint32_t left = frequency; left > 0; --left) {
      fields_.ReadVInt();
      fields_.ReadVInt();
    }
  }
}

}  // namespace vantrel::elastic::format
