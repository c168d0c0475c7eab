#include "elastic/format/segment/term_text.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <span>

#include "elastic/common/text.h"
#include "elastic/format/segment/utf16_text.h"

namespace vantrel::elastic::format {
namespace {

// The place of a UTF-16 code unit in the order of code points: surrogates, which stand for what lies beyond 16 bits,
// behind all others.
uint32_t CodePointRank(char16_t unit) {
  if (unit < 0xd800) return unit;
  return unit >= 0xe000 ? unit - 0x800U : unit + 0x2000U;
}

// By which orders `left` comes before `right`; they have the first `same` units in common, and there they differ.
TermOrders UnitOrdersBefore(std::u16string_view left, std::u16string_view right, size_t same) {
  if (same == right.size()) return 0;
  if (same == left.size()) return kByBoth;
  return static_cast<TermOrders>(
      (CodePointRank(left[same]) < CodePointRank(right[same]) ? kByCodePoints : 0) |
      (left[same] < right[same] ? kByUtf16 : 0));
}

}  // namespace

RawText RawText::From(size_t length) const {
  return {bytes.substr(std::min(length, bytes.size())), units.substr(std::min(length, units.size()))};
}

void RawText::Prepend(const RawText& text, size_t length) {
  bytes.insert(0, text.bytes, 0, length);
  units.insert(0, text.units, 0, length);
}

void TermText::Grow(size_t length) { bytes_.resize(std::max(2 * bytes_.size(), length + kSlack)); }

void TermText::Read(ByteReader& reader, uint64_t start) {
  is_utf8_ ? ReadUtf8(reader, start) : ReadUnits(reader, start);
}

// Takes the next text where it lies in the buffer, and both its lengths take one byte. False, with nothing changed, where
// it does not, or is damaged.
bool TermText::ReadFromWindow(ByteReader& reader) {
  constexpr size_t kTwoLengths = 2;
  constexpr size_t kShort = 0x7f;
  static_assert(2 * kShort <= kLongestTerm);
  const std::span<const uint8_t> window = reader.Window(kTwoLengths + kShort + kSlack);
  if (window.size() < kTwoLengths + kSlack) return false;
  const uint32_t prefix = window[0];
  const uint32_t suffix = window[1];
  if ((prefix | suffix) > kShort || prefix > length_ || window.size() < kTwoLengths + kSlack + suffix) {
    return false;
  }
  TakeNext(prefix, window.data() + kTwoLengths, suffix);
  reader.Advance(kTwoLengths + suffix);
  return true;
}

void TermText::ReadUtf8(ByteReader& reader, uint64_t start) {
  if (ReadFromWindow(reader)) return;
  const uint32_t prefix = reader.ReadVInt();
  const uint32_t suffix = reader.ReadVInt();
  if (prefix > length_) {
    reader.Damaged(start,
                   "term shares " + std::to_string(prefix) + " bytes with one of " + std::to_string(length_));
  }
  const size_t length = size_t{prefix} + suffix;
  if (length > kLongestTerm) {
    reader.Damaged(start, "term of " + std::to_string(length) + " bytes is too long");
  }
  converted_.resize(suffix + kSlack);
  const std::span bytes(reinterpret_cast<uint8_t*>(converted_.data()), suffix);
  reader.ReadBytes(bytes);
  TakeNext(prefix, bytes.data(), suffix);
}

void TermText::CompareOn(size_t same, const uint8_t* suffix, uint32_t length) {
  const std::string_view before = text().substr(same);
  const std::string_view next(reinterpret_cast<const char*>(suffix), length);
  const size_t also_same = SameLength(before, next);
  same_length_ += also_same;
  ascends_by_ = OrdersBefore(before, next, also_same);
}

void TermText::ReadUnits(ByteReader& reader, uint64_t start) {
  const uint32_t prefix = reader.ReadVInt();
  const uint32_t suffix = reader.ReadVInt();
  if (prefix > units_.size()) {
    reader.Damaged(start, "term shares " + std::to_string(prefix) + " characters with one of " +
                              std::to_string(units_.size()));
  }
  if (size_t{prefix} + suffix > kLongestText) {
    reader.Damaged(reader.offset(),
                   "text of " + std::to_string(size_t{prefix} + suffix) + " characters is too long");
  }
  shared_length_ = prefix;
  next_units_.clear();
  ReadUtf16Units(reader, suffix, next_units_);
  TakeUnits(prefix);
}

// The text goes on with next_units_ behind its first `prefix` units.
void TermText::TakeUnits(size_t prefix) {
  const std::u16string_view before = std::u16string_view(units_).substr(prefix);
  const auto [left, right] =
      std::mismatch(before.begin(), before.end(), next_units_.begin(), next_units_.end());
  const auto also_same = static_cast<size_t>(left - before.begin());
  ascends_by_ = UnitOrdersBefore(before, next_units_, also_same);
  // What is converted again begins with a whole character in both texts: it may take in half a pair of surrogates.
  size_t same = prefix + also_same;
  size_t converted = units_.size();
  if (same > 0 && IsHighSurrogate(units_[same - 1])) --same;
  while (converted > same) {
    length_ = CharacterStart(length_ - 1);
    // A character of four bytes was two units.
    converted -= static_cast<unsigned char>(bytes_[length_]) >= 0xf0 ? 2U : 1U;
  }
  same_length_ = length_;
  ForgetFrom(length_);
  units_.resize(prefix);
  units_.append(next_units_);
  AppendConverted(std::u16string_view(units_).substr(same));
}

void TermText::AppendConverted(std::u16string_view units) {
  converted_.clear();
  AppendUtf16(units, converted_);
  Reserve(length_ + converted_.size());
  std::copy(converted_.begin(), converted_.end(), bytes_.begin() + static_cast<ptrdiff_t>(length_));
  length_ += converted_.size();
}

// Whether the text from `offset` on is ASCII. False also where it is empty, or longer than kSlack bytes: only two words are
// read.
bool TermText::IsShortAsciiFrom(size_t offset) const {
  static_assert(std::endian::native == std::endian::little, "the first byte of a word is its lowest");
  constexpr uint64_t kHighBits = 0x8080808080808080;
  const size_t length = length_ - offset;
  if (length == 0 || length > kSlack) return false;
  uint64_t words[2];
  static_assert(sizeof words == kSlack);
  std::memcpy(words, bytes_.data() + offset, sizeof words);
  // What lies behind the text is shifted out.
  if (length <= 8) return (words[0] & kHighBits) << (8 * (8 - length)) == 0;
  return (words[0] & kHighBits) == 0 && (words[1] & kHighBits) << (8 * (kSlack - length)) == 0;
}

bool TermText::ValidateOn() {
  if (IsShortAsciiFrom(valid_length_)) {
    valid_length_ = length_;
    return true;
  }
  valid_length_ += WellFormedLength(text().substr(valid_length_));
  return valid_length_ == length_;
}

bool TermText::KeepOn() {
  if (IsShortAsciiFrom(kept_length_)) {
    kept_length_ = length_;
    return true;
  }
  kept_length_ += KeptLength(text().substr(kept_length_));
  return kept_length_ == length_;
}

void TermText::Clear() {
  length_ = shared_length_ = 0;
  same_length_ = valid_length_ = kept_length_ = 0;
  ascends_by_ = 0;
  units_.clear();
}

void TermText::Assign(const RawText& text) {
  Clear();
  if (is_utf8_) {
    Reserve(text.bytes.size());
    std::copy(text.bytes.begin(), text.bytes.end(), bytes_.begin());
    length_ = text.bytes.size();
  } else {
    units_ = text.units;
    AppendConverted(units_);
  }
}

void TermText::UpdateCopy(RawText& copy) const {
  if (is_utf8_) {
    copy.bytes.resize(shared_length_);
    copy.bytes.append(text().substr(shared_length_));
  } else {
    copy.units.resize(shared_length_);
    copy.units.append(units_, shared_length_);
  }
}

}  // namespace vantrel::elastic::format
