#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {

// A value goes on past the end of its source. Who has read the same bytes so far, by the same layout, comes to the
// same end.
class EndOfFileError : public IndexDamagedError {
 public:
  using IndexDamagedError::IndexDamagedError;
};

// A buffered cursor over a byte source that decodes the primitives of index files:
//
//   Int     4 bytes, big-endian, signed
//   Long    8 bytes, big-endian, signed
//   VInt    1 to 5 bytes of 7 bits each, lowest first; the high bit says that more follow
//   VLong   1 to 9 bytes, the same
//   String  VInt length in bytes, then UTF-8
//
// Every read is checked against the end of the source. What lies beyond it, or does not fit its type, is
// reported by IndexDamagedError at the offset where the value begins (EndOfFileError where a number or bytes go on
// past the end, but not a string that announces it). For one thread at a time.
class ByteReader {
 public:
  static constexpr size_t kDefaultBufferSize = size_t{16} << 10;

  // The buffer is allocated by the first read, and never larger than the source.
  explicit ByteReader(std::shared_ptr<const ByteSource> source, size_t buffer_size = kDefaultBufferSize);
  ByteReader(const ByteReader&) = delete;
  ByteReader& operator=(const ByteReader&) = delete;
  ByteReader(ByteReader&&) = default;
  ByteReader& operator=(ByteReader&&) = default;
  ~ByteReader() = default;

  const std::string& name() const { return *name_; }
  uint64_t size() const { return size_; }
  uint64_t offset() const { return buffer_start_ + position_; }
  uint64_t remaining() const { return size() - offset(); }

  // Moves to `offset`, which may be the end but not past it.
  void Seek(uint64_t offset) {
    if (offset < buffer_start_ || offset - buffer_start_ > filled_) return SeekOutside(offset);
    position_ = static_cast<size_t>(offset - buffer_start_);
  }
  void Skip(uint64_t count);

  uint8_t ReadByte() {
    if (position_ == filled_) Refill(1);
    return data_[position_++];
  }
  int32_t ReadInt();
  int64_t ReadLong();

  uint32_t ReadVInt() {
    if (position_ < filled_ && data_[position_] < 0x80) return data_[position_++];
    return ReadLongVInt();
  }
  uint64_t ReadVLong() {
    if (position_ < filled_ && data_[position_] < 0x80) return data_[position_++];
    return ReadLongVLong();
  }

  void ReadBytes(std::span<uint8_t> out);

  // Moves past the next bytes, at least one and at most `most` (which is not 0), and hands them out as they lie
  // in the buffer, valid until the next call. For who goes through many bytes without keeping them.
  std::span<const uint8_t> Take(uint64_t most);

  // The next bytes as they lie in the buffer, at least `wanted` where the source has so many and the buffer holds
  // them, without moving; valid until the next call. Then Advance(), by no more than was handed out.
  std::span<const uint8_t> Window(size_t wanted) {
    if (filled_ - position_ < wanted && remaining() > filled_ - position_) Refill(1);
    return {data_ + position_, filled_ - position_};
  }
  void Advance(size_t count) { position_ += count; }

  // Moves past `count` VInts, if each of them takes three bytes at most. False, and at an unspecified offset, where one
  // is longer, or may be, or the source ends.
  bool PassShortVInts(uint64_t count);

  // Reads from the buffer of `lender`, which reads the same source, as long as the offset lies in that buffer. So bytes
  // that are already in memory are not read again. Seek() must follow. The buffer must stay as it is until GiveBack():
  // each change of it changes the lender's fills().
  void Borrow(const ByteReader& lender);
  // Stays at the offset and forgets the lender's buffer, if it still uses it.
  void GiveBack();
  // How many times the buffer was filled.
  uint64_t fills() const { return fills_; }
  size_t buffer_size() const { return buffer_size_; }

  // Throws where what watches the source (WatchedFolder) cancels. Reads do the same; this is for work out of proportion
  // to the bytes read.
  void AllowCancel() const { source_->ReadAt(0, {}); }

  // A string; throws also when it is not valid UTF-8, or longer than kLongestText.
  std::string ReadString();

  // Throws IndexDamagedError about this source.
  [[noreturn]] void Damaged(uint64_t offset, const std::string& problem) const;

 private:
  uint32_t ReadLongVInt();
  uint64_t ReadLongVLong();
  void Refill(uint64_t wanted);
  void SeekOutside(uint64_t offset);
  [[noreturn]] void RefuseEnd(uint64_t offset, uint64_t wanted) const;
  bool PassManyShortVInts(uint64_t count);
  bool PassShortVIntsAtEnd(uint64_t count);

  std::shared_ptr<const ByteSource> source_;
  const std::string* name_;  // the source's
  uint64_t size_;
  size_t buffer_size_;
  std::vector<uint8_t> buffer_;
  const uint8_t* data_ = nullptr;  // the contents of buffer_, or of the lender's
  uint64_t buffer_start_ = 0;      // offset in the source of data_[0]
  size_t position_ = 0;            // next byte in data_
  size_t filled_ = 0;              // valid bytes in data_
  uint64_t fills_ = 0;
};

}  // namespace vantrel::elastic::format
