#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/term_order.h"

namespace vantrel::elastic::format {

// A term's text by itself, as its layout holds it.
struct RawText {
  std::string bytes;     // UTF-8,
  std::u16string units;  // or in the older layouts UTF-16

  // In bytes.
  size_t size() const { return bytes.size() + units.size() * sizeof(char16_t); }
  // What follows the first `length` bytes or units, and that put behind the first `length` of another text.
  RawText From(size_t length) const;
  void Prepend(const RawText& text, size_t length);
};

// The text of the term at a cursor, in a dictionary or a term vector, where it begins with a part of the text before:
//
//   VInt prefix shared with the text before, VInt length of what follows, that text
//     in UTF-8 (dictionaries of format -4, vectors of format 4): in bytes
//     in the older layouts: in UTF-16 code units, see text.h
//
// Whatever is done with a text takes time in proportion to the bytes that were read for it, not to its length: only
// what follows the shared prefix is copied, converted, compared with the text before, and validated. Memory is that of
// the longest text: kLongestTerm bytes, or kLongestText units.
class TermText {
 public:
  explicit TermText(bool is_utf8) : is_utf8_(is_utf8) {}

  bool is_utf8() const { return is_utf8_; }

  // Reads the next text. Errors are reported at `start`, where the term begins. Throws IndexDamagedError, IndexIoError.
  void Read(ByteReader& reader, uint64_t start);

  // Takes the next text from memory, where `prefix` is at most the length of the one before and the whole is not longer
  // than kLongestTerm. In UTF-8 only. At least 16 bytes can be read at `suffix`.
  void TakeNext(uint32_t prefix, const uint8_t* suffix, uint32_t length) {
    Compare(prefix, suffix, length);
    Reserve(size_t{prefix} + length);
    char* const to = bytes_.data() + prefix;
    if (length <= kSlack) {
      __builtin_memcpy(to, suffix, kSlack);
    } else {
      __builtin_memcpy(to, suffix, length);
    }
    length_ = size_t{prefix} + length;
  }

  // The bytes of the file, or their conversion: UTF-8 if undamaged. Valid until the next text is read.
  std::string_view text() const { return {bytes_.data(), length_}; }

  // How much room there is for texts, in bytes of UTF-8.
  size_t room() const { return bytes_.size(); }

  // How much the text takes from the one before, in bytes or units, as the file states it.
  uint32_t shared_length() const { return shared_length_; }
  // How many leading bytes are those of the text before; in the older layouts, those of whole characters.
  size_t same_length() const { return same_length_; }
  // By which orders the text comes after the one before.
  TermOrders ascends_by() const { return ascends_by_; }

  // Whether it is well-formed UTF-8, and whether the index library can keep it (IsKeptText).
  bool IsValid() { return valid_length_ == length_ || ValidateOn(); }
  bool IsKept() { return IsValid() && (kept_length_ == length_ || KeepOn()); }

  // The empty text, as before the first term.
  void Clear();
  // Replaces the text; the next one builds on it.
  void Assign(const RawText& text);
  // Makes a copy of the text out of a copy of the text before.
  void UpdateCopy(RawText& copy) const;

 private:
  static constexpr size_t kSlack = 16;

  bool ReadFromWindow(ByteReader& reader);
  void ReadUtf8(ByteReader& reader, uint64_t start);
  void ReadUnits(ByteReader& reader, uint64_t start);
  void TakeUnits(size_t prefix);
  void Compare(uint32_t prefix, const uint8_t* suffix, uint32_t length);
  void CompareOn(size_t same, const uint8_t* suffix, uint32_t length);
  size_t CharacterStart(size_t offset) const;
  bool IsShortAsciiFrom(size_t offset) const;
  bool ValidateOn();
  bool KeepOn();
  void ForgetFrom(size_t offset);
  void Reserve(size_t length) {
    if (length + kSlack > bytes_.size()) Grow(length);
  }
  void Grow(size_t length);
  void AppendConverted(std::u16string_view units);

  bool is_utf8_;
  std::string bytes_;  // the text, and room behind it
  size_t length_ = 0;
  std::u16string units_;  // the text of the older layouts
  std::u16string next_units_;
  std::string converted_;
  uint32_t shared_length_ = 0;
  size_t same_length_ = 0;
  TermOrders ascends_by_ = 0;
  size_t valid_length_ = 0;  // known to be well-formed, up to the end of a character
  size_t kept_length_ = 0;   // of these, known to be kept by the library
};

inline void TermText::ForgetFrom(size_t offset) {
  if (offset >= valid_length_) return;
  offset = CharacterStart(offset);
  valid_length_ = offset;
  if (kept_length_ > offset) kept_length_ = offset;
}

inline size_t TermText::CharacterStart(size_t offset) const {
  while (offset > 0 && (static_cast<unsigned char>(bytes_[offset]) & 0xc0) == 0x80) --offset;
  return offset;
}

// Most often, the first byte that follows decides.
inline void TermText::Compare(uint32_t prefix, const uint8_t* suffix, uint32_t length) {
  shared_length_ = prefix;
  ForgetFrom(prefix);
  same_length_ = prefix;
  const auto before = static_cast<unsigned char>(prefix < length_ ? bytes_[prefix] : 0);
  if (prefix < length_ && length > 0 && before < *suffix && *suffix < 0xee) {
    ascends_by_ = kByBoth;
  } else if (prefix == length_) {
    ascends_by_ = length > 0 ? kByBoth : TermOrders{0};
  } else {
    CompareOn(prefix, suffix, length);
  }
}

}  // namespace vantrel::elastic::format
