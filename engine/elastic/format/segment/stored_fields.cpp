#include "elastic/format/segment/stored_fields.h"

#include <string>
#include <utility>

#include "elastic/common/text.h"

namespace vantrel::elastic::format {
namespace {

// Format numbers, each named after what it brought.
constexpr int32_t kWithUtf8Values = 1;
constexpr int32_t kWithoutCompression = 2;

constexpr size_t kIndexBufferSize = size_t{64} << 10;
constexpr size_t kRecordsBufferSize = size_t{128} << 10;

}  // namespace

StoredFieldsReader::StoredFieldsReader(std::shared_ptr<const ByteSource> index,
                                       std::shared_ptr<const ByteSource> records)
    : index_(std::move(index), kIndexBufferSize), records_(std::move(records), kRecordsBufferSize) {
  // The oldest layout begins with a pointer, whose upper half is 0; without documents it is empty.
  if (index_.size() == 0 && records_.size() == 0) return;
  format_ = index_.ReadInt();
  if (format_ < 0 || format_ > kWithoutCompression) {
    index_.Damaged(0, "format is " + std::to_string(format_) + ", but 0 to 2 are known");
  }
  header_ = format_ == 0 ? 0 : 4;
  if (format_ != 0) {
    const int32_t again = records_.ReadInt();
    if (again != format_) {
      records_.Damaged(
          0, "format is " + std::to_string(again) + ", but the index has format " + std::to_string(format_));
    }
  }
  if ((index_.size() - header_) % kPointerSize != 0) {
    index_.Damaged(index_.size(), "the file ends within a pointer");
  }
}

uint64_t StoredFieldsReader::ReadPointer(uint64_t document) {
  if (document == documents()) return records_.size();
  index_.Seek(PointerOffset(document));
  const auto pointer = static_cast<uint64_t>(index_.ReadLong());
  if (pointer < header_ || pointer >= records_.size()) {
    index_.Damaged(PointerOffset(document), "pointer is " + std::to_string(static_cast<int64_t>(pointer)) +
                                                ", but the records end at " +
                                                std::to_string(records_.size()));
  }
  return pointer;
}

void StoredFieldsReader::Seek(uint64_t document) {
  start_ = ReadPointer(document);
  end_ = ReadPointer(document + 1);
  if (end_ <= start_) {
    index_.Damaged(PointerOffset(document + 1), "pointer is " + std::to_string(end_) +
                                                    ", but the one before is " + std::to_string(start_));
  }
  records_.Seek(start_);
  fields_left_ = records_.ReadVInt();
}

bool StoredFieldsReader::Next() {
  if (fields_left_ == 0) return false;
  field_offset_ = records_.offset();
  if (field_offset_ >= end_) {
    records_.Damaged(field_offset_,
                     "record ends here, but " + std::to_string(fields_left_) + " more fields are announced");
  }
  number_ = records_.ReadVInt();
  flags_ = records_.ReadByte();
  --fields_left_;
  return true;
}

uint8_t StoredFieldsReader::known_flags() const {
  return format_ < kWithoutCompression ? kCut | kBinary | kCompressed : kCut | kBinary;
}

void StoredFieldsReader::PassValue() {
  const uint64_t start = records_.offset();
  const uint64_t length = records_.ReadVInt();
  // A UTF-16 code unit takes a byte at least.
  if (records_.offset() > end_ || length > end_ - records_.offset()) {
    records_.Damaged(start, "value of " + std::to_string(length) + " reaches past its record's end at " +
                                std::to_string(end_));
  }
  if ((flags_ & kCompressed) != 0) {
    PassCompressed(start, length);
  } else if ((flags_ & kBinary) != 0) {
    records_.Skip(length);
  } else if (format_ >= kWithUtf8Values) {
    PassText(start, length);
  } else {
    PassUtf16(start, length);
  }
}

void StoredFieldsReader::PassText(uint64_t start, uint64_t length) {
  Utf8Scanner scanner;
  while (length > 0) {
    const auto piece = records_.Take(length);
    if (!scanner.Take(piece)) records_.Damaged(start, "value is not valid UTF-8");
    length -= piece.size();
  }
  if (!scanner.IsComplete()) records_.Damaged(start, "value is not valid UTF-8");
}

void StoredFieldsReader::PassUtf16(uint64_t start, uint64_t count) {
  for (; count > 0; --count) {
    const uint8_t lead = records_.ReadByte();
    for (int left = lead >= 0xe0 ? 2 : lead >= 0x80 ? 1 : 0; left > 0; --left) {
      if ((records_.ReadByte() & 0xc0) != 0x80) {
        records_.Damaged(start, "character is not encoded as its first byte announces");
      }
    }
  }
}

void StoredFieldsReader::PassCompressed(uint64_t start, uint64_t length) {
  if (inflater_.has_value()) {
    inflater_->Restart();
  } else {
    inflater_.emplace();
  }
  Utf8Scanner scanner;
  const bool is_text = (flags_ & kBinary) == 0;
  uint64_t value_size = 0;
  while (length > 0) {
    const auto piece = records_.Take(length);
    compressed_ += piece.size();
    const bool good = inflater_->Take(piece, [&](std::span<const uint8_t> inflated) {
      value_size += inflated.size();
      inflated_ += inflated.size();
      RequireWithinBounds(start, value_size);
      records_.AllowCancel();
      return !is_text || scanner.Take(inflated);
    });
    if (!good) records_.Damaged(start, "compressed value cannot be inflated to what it should be");
    length -= piece.size();
  }
  if (!inflater_->IsComplete() || !scanner.IsComplete()) {
    records_.Damaged(start, "compressed value is cut off");
  }
}

void StoredFieldsReader::RequireWithinBounds(uint64_t start, uint64_t value_size) const {
  if (value_size > kLongestInflated) {
    records_.Damaged(start,
                     "compressed value inflates to more than " + std::to_string(kLongestInflated) + " bytes");
  }
  if (inflated_ > kFreelyInflated && inflated_ - kFreelyInflated > kMostInflation * compressed_) {
    records_.Damaged(start, "compressed values up to this one inflate to more than " +
                                std::to_string(kMostInflation) + " times their size");
  }
}

}  // namespace vantrel::elastic::format
