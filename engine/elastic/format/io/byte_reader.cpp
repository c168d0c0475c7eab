#include "elastic/format/io/byte_reader.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <utility>

#include "elastic/common/text.h"
#include "elastic/format/io/wide_scan.h"

namespace vantrel::elastic::format {

ByteReader::ByteReader(std::shared_ptr<const ByteSource> source, size_t buffer_size)
    : source_(std::move(source)),
      name_(&source_->name()),
      size_(source_->size()),
      buffer_size_(buffer_size) {}

void ByteReader::Damaged(uint64_t offset, const std::string& problem) const {
  throw IndexDamagedError(name(), offset, problem);
}

void ByteReader::RefuseEnd(uint64_t offset, uint64_t wanted) const {
  throw EndOfFileError(
      name(), offset,
      "wanted " + std::to_string(wanted) + " more bytes, but the file ends at " + std::to_string(size()));
}

void ByteReader::Refill(uint64_t wanted) {
  const uint64_t start = offset();
  if (wanted > size() - start) RefuseEnd(start, wanted);
  const auto length = static_cast<size_t>(std::min<uint64_t>(buffer_size_, size() - start));
  ++fills_;
  if (buffer_.size() < length) buffer_.resize(length);
  data_ = buffer_.data();
  // Empty while the read runs: should it throw, the next attempt starts at the same offset.
  buffer_start_ = start;
  position_ = filled_ = 0;
  source_->ReadAt(start, std::span(buffer_.data(), length));
  filled_ = length;
}

void ByteReader::SeekOutside(uint64_t offset) {
  if (offset > size()) {
    Damaged(offset, "offset lies past the end of the file at " + std::to_string(size()));
  }
  buffer_start_ = offset;
  position_ = filled_ = 0;
}

void ByteReader::Skip(uint64_t count) {
  if (count > remaining()) {
    Damaged(offset(), "wanted to skip " + std::to_string(count) + " bytes, but the file ends at " +
                          std::to_string(size()));
  }
  Seek(offset() + count);
}

int32_t ByteReader::ReadInt() {
  uint8_t bytes[4];
  ReadBytes(bytes);
  uint32_t value = 0;
  for (const uint8_t byte : bytes) value = value << 8 | byte;
  return static_cast<int32_t>(value);
}

int64_t ByteReader::ReadLong() {
  uint8_t bytes[8];
  ReadBytes(bytes);
  uint64_t value = 0;
  for (const uint8_t byte : bytes) value = value << 8 | byte;
  return static_cast<int64_t>(value);
}

uint32_t ByteReader::ReadLongVInt() {
  // Two bytes, both in the buffer: most of those that take more than one.
  if (filled_ - position_ >= 2 && data_[position_ + 1] < 0x80) {
    const uint32_t value = (data_[position_] & 0x7fU) | uint32_t{data_[position_ + 1]} << 7;
    position_ += 2;
    return value;
  }
  const uint64_t start = offset();
  uint32_t value = 0;
  for (int shift = 0; shift < 28; shift += 7) {
    const uint8_t byte = ReadByte();
    value |= static_cast<uint32_t>(byte & 0x7f) << shift;
    if (byte < 0x80) return value;
  }
  const uint8_t last = ReadByte();
  if (last > 0x0f) Damaged(start, "variable-length number does not fit 32 bits");
  return value | static_cast<uint32_t>(last) << 28;
}

uint64_t ByteReader::ReadLongVLong() {
  const uint64_t start = offset();
  uint64_t value = 0;
  for (int shift = 0; shift < 63; shift += 7) {
    const uint8_t byte = ReadByte();
    value |= static_cast<uint64_t>(byte & 0x7f) << shift;
    if (byte < 0x80) return value;
  }
  Damaged(start, "variable-length number does not fit 63 bits");
}

void ByteReader::ReadBytes(std::span<uint8_t> out) {
  if (out.size() > remaining()) RefuseEnd(offset(), out.size());
  const size_t buffered = std::min(out.size(), filled_ - position_);
  std::copy_n(data_ + position_, buffered, out.begin());
  position_ += buffered;
  out = out.subspan(buffered);
  if (out.empty()) return;
  if (out.size() >= buffer_size_) {
    const uint64_t start = offset();
    source_->ReadAt(start, out);
    Seek(start + out.size());
    return;
  }
  Refill(out.size());
  std::copy_n(data_, out.size(), out.begin());
  position_ = out.size();
}

std::span<const uint8_t> ByteReader::Take(uint64_t most) {
  if (position_ == filled_) Refill(1);
  const auto length = static_cast<size_t>(std::min<uint64_t>(most, filled_ - position_));
  const std::span<const uint8_t> taken(data_ + position_, length);
  position_ += length;
  return taken;
}

// Few of them, in the next eight bytes, are the most frequent case.
bool ByteReader::PassShortVInts(uint64_t count) {
  constexpr uint64_t kHighBits = 0x8080808080808080;
  static_assert(std::endian::native == std::endian::little, "the first byte is the lowest of the eight");
  uint64_t bytes = 0;
  if (count - 1 >= sizeof bytes || filled_ - position_ < sizeof bytes) return PassManyShortVInts(count);
  std::memcpy(&bytes, data_ + position_, sizeof bytes);
  const uint64_t more = bytes & kHighBits;
  uint64_t ends = more ^ kHighBits;
  const uint64_t ended = (ends >> 7) * 0x0101010101010101 >> 56;  // how many bits are set
  if (ended < count || (more & more << 8 & more << 16) != 0) return PassManyShortVInts(count);
  while (--count > 0) ends &= ends - 1;
  position_ += static_cast<size_t>(std::countr_zero(ends) / 8 + 1);
  return true;
}

bool ByteReader::PassManyShortVInts(uint64_t count) {
  while (count > 0) {
    const auto window = Window(kScanStep);
    if (window.size() < kScanStep) return PassShortVIntsAtEnd(count);
    const uint8_t* next = window.data();
    if (!format::PassShortVInts(BestScanInstructions(), next, window.data() + window.size(), count))
      return false;
    Advance(static_cast<size_t>(next - window.data()));
  }
  return true;
}

// For what is left of the source when it is shorter than a step, and for buffers that are.
bool ByteReader::PassShortVIntsAtEnd(uint64_t count) {
  for (int length = 1; count > 0; ++length) {
    if (remaining() == 0 || length > 3) return false;
    if (ReadByte() >= 0x80) continue;
    --count;
    length = 0;
  }
  return true;
}

void ByteReader::Borrow(const ByteReader& lender) {
  data_ = lender.data_;
  buffer_start_ = lender.buffer_start_;
  position_ = 0;
  filled_ = lender.filled_;
}

void ByteReader::GiveBack() {
  if (data_ == buffer_.data()) return;
  data_ = buffer_.data();
  buffer_start_ = offset();
  position_ = filled_ = 0;
}

std::string ByteReader::ReadString() {
  const uint64_t start = offset();
  const uint32_t length = ReadVInt();
  if (length > remaining()) {
    Damaged(start, "string of " + std::to_string(length) + " bytes reaches past the end of the file at " +
                       std::to_string(size()));
  }
  if (length > kLongestText) Damaged(start, "string of " + std::to_string(length) + " bytes is too long");
  std::string text(length, '\0');
  ReadBytes(std::span(reinterpret_cast<uint8_t*>(text.data()), text.size()));
  if (!IsValidUtf8(text)) Damaged(start, "string is not valid UTF-8");
  return text;
}

}  // namespace vantrel::elastic::format
