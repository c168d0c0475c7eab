#include "elastic/common/text.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cstdint>
#include <cstring>

namespace vantrel::elastic {
namespace {

constexpr char32_t kReplacement = 0xfffd;

// Decodes the sequence that begins at `next` and moves past it; false where it is ill-formed. The caller has
// seen that it does not begin with an ASCII byte.
bool DecodeMultibyte(const uint8_t*& next, const uint8_t* end, char32_t& code_point) {
  const uint8_t lead = *next;
  const int length = lead >= 0xf0 ? 4 : lead >= 0xe0 ? 3 : 2;
  if (lead < 0xc2 || lead > 0xf4 || end - next < length) return false;
  char32_t value = lead & (0xffU >> (length + 1));
  for (int i = 1; i < length; ++i) {
    if ((next[i] & 0xc0) != 0x80) return false;
    value = value << 6 | (next[i] & 0x3fU);
  }
  constexpr char32_t kSmallest[] = {0x80, 0x800, 0x10000};
  if (value < kSmallest[length - 2] || value > 0x10ffff || (value >= 0xd800 && value <= 0xdfff)) return false;
  next += length;
  code_point = value;
  return true;
}

// How many bytes a sequence has that begins with `lead`, as far as that tells.
size_t SequenceLength(uint8_t lead) { return lead >= 0xf0 ? 4 : lead >= 0xe0 ? 3 : lead >= 0xc0 ? 2 : 1; }

template <typename Word>
Word Load(const uint8_t* from) {
  Word word = 0;
  std::memcpy(&word, from, sizeof word);
  return word;
}

constexpr uint64_t kHighBits = 0x8080808080808080;
static_assert(std::endian::native == std::endian::little, "the first byte of a word is its lowest");

// Moves past ASCII, 16 bytes at a time.
const uint8_t* SkipAscii(const uint8_t* next, const uint8_t* end) {
  while (end - next >= 16) {
    if (((Load<uint64_t>(next) | Load<uint64_t>(next + 8)) & kHighBits) != 0) break;
    next += 16;
  }
  while (end - next >= 8) {
    const uint64_t high = Load<uint64_t>(next) & kHighBits;
    if (high != 0) return next + std::countr_zero(high) / 8;
    next += 8;
  }
  // Words that overlap: most texts end here, and most are ASCII.
  const auto left = static_cast<size_t>(end - next);
  if (left >= 4) {
    if (((Load<uint32_t>(next) | Load<uint32_t>(end - 4)) & static_cast<uint32_t>(kHighBits)) == 0)
      return end;
  } else if (left == 0 || (next[0] | next[left / 2] | next[left - 1]) < 0x80) {
    return end;
  }
  while (*next < 0x80) ++next;
  return next;
}

// An automaton that accepts well-formed UTF-8. A state is a shift: the entry of a byte, shifted by the state, has the
// next state in its lowest bits, so that a byte takes one load and one shift.
enum : uint64_t {
  kReject = 0,
  kAccept = 6,  // between characters
  kOneMore = 12,
  kTwoMore = 18,
  kThreeMore = 24,
  kAfterE0 = 30,  // of two more, the next one must not make an overlong form,
  kAfterEd = 36,  // a surrogate,
  kAfterF0 = 42,  // of three more, an overlong form,
  kAfterF4 = 48,  // a code point above U+10FFFF
};
constexpr uint64_t kStateBits = 63;

constexpr uint64_t AutomatonEntry(uint64_t byte) {
  const auto in = [byte](uint64_t first, uint64_t last) { return byte >= first && byte <= last; };
  uint64_t start = kReject;
  if (byte < 0x80) start = kAccept;
  if (in(0xc2, 0xdf)) start = kOneMore;
  if (in(0xe0, 0xef)) start = byte == 0xe0 ? kAfterE0 : byte == 0xed ? kAfterEd : kTwoMore;
  if (in(0xf0, 0xf4)) start = byte == 0xf0 ? kAfterF0 : byte == 0xf4 ? kAfterF4 : kThreeMore;
  uint64_t entry = start << kAccept;
  if (in(0x80, 0xbf)) entry |= kAccept << kOneMore | kOneMore << kTwoMore | kTwoMore << kThreeMore;
  if (in(0xa0, 0xbf)) entry |= kOneMore << kAfterE0;
  if (in(0x80, 0x9f)) entry |= kOneMore << kAfterEd;
  if (in(0x90, 0xbf)) entry |= kTwoMore << kAfterF0;
  if (in(0x80, 0x8f)) entry |= kTwoMore << kAfterF4;
  return entry;
}

constexpr std::array<uint64_t, 256> kAutomaton = [] {
  std::array<uint64_t, 256> entries{};
  for (size_t byte = 0; byte < entries.size(); ++byte) entries[byte] = AutomatonEntry(byte);
  return entries;
}();

template <typename Sink>
bool ForEachCodePoint(std::string_view text, Sink sink) {
  const auto* next = reinterpret_cast<const uint8_t*>(text.data());
  const uint8_t* const end = next + text.size();
  while (next != end) {
    char32_t code_point = *next;
    if (code_point < 0x80) {
      ++next;
    } else if (!DecodeMultibyte(next, end, code_point)) {
      return false;
    }
    sink(code_point);
  }
  return true;
}

}  // namespace

bool TakeCodePoint(std::string_view& text, char32_t& code_point) {
  const auto* const begin = reinterpret_cast<const uint8_t*>(text.data());
  const uint8_t* next = begin;
  code_point = *next;
  if (code_point < 0x80) {
    ++next;
  } else if (!DecodeMultibyte(next, begin + text.size(), code_point)) {
    return false;
  }
  text.remove_prefix(static_cast<size_t>(next - begin));
  return true;
}

void AppendUtf8(char32_t code_point, std::string& out) {
  const auto append = [&out](char32_t byte) { out.push_back(static_cast<char>(byte)); };
  if (code_point < 0x80) {
    append(code_point);
  } else if (code_point < 0x800) {
    append(0xc0 | code_point >> 6);
    append(0x80 | (code_point & 0x3f));
  } else if (code_point < 0x10000) {
    append(0xe0 | code_point >> 12);
    append(0x80 | (code_point >> 6 & 0x3f));
    append(0x80 | (code_point & 0x3f));
  } else {
    append(0xf0 | code_point >> 18);
    append(0x80 | (code_point >> 12 & 0x3f));
    append(0x80 | (code_point >> 6 & 0x3f));
    append(0x80 | (code_point & 0x3f));
  }
}

size_t WellFormedLength(std::string_view text) {
  const auto* const begin = reinterpret_cast<const uint8_t*>(text.data());
  const uint8_t* const end = begin + text.size();
  constexpr ptrdiff_t kStride = 16;
  const uint8_t* next = begin;
  const uint8_t* good = begin;  // up to here, all is well-formed
  uint64_t state = kAccept;
  while (true) {
    if (state == kAccept) good = next = SkipAscii(next, end);
    if (next == end || state == kReject) break;
    const uint8_t* const stop = next + std::min(kStride, end - next);
    for (; next != stop; ++next) state = kAutomaton[*next] >> (state & kStateBits);
    state &= kStateBits;
  }
  char32_t ignored = 0;
  while ((good = SkipAscii(good, end)) != end) {
    if (!DecodeMultibyte(good, end, ignored)) break;
  }
  return static_cast<size_t>(good - begin);
}

bool IsValidUtf8(std::string_view text) { return WellFormedLength(text) == text.size(); }

size_t KeptLength(std::string_view text) {
  const auto* const begin = reinterpret_cast<const uint8_t*>(text.data());
  const uint8_t* const end = begin + text.size();
  // The last two bytes of each of them are BF BE or BF BF.
  for (const uint8_t* next = SkipAscii(begin, end); next != end; ++next) {
    if (*next != 0xbf || end - next < 2 || (next[1] | 1) != 0xbf) continue;
    if (next - begin >= 1 && next[-1] == 0xef) return static_cast<size_t>(next - 1 - begin);
    if (next - begin >= 2 && next[-1] == 0x9f && next[-2] == 0xf0 && next[1] == 0xbf) {
      return static_cast<size_t>(next - 2 - begin);
    }
  }
  return text.size();
}

bool IsKeptText(std::string_view text) { return IsValidUtf8(text) && KeptLength(text) == text.size(); }

bool Utf8Scanner::CompleteHeld(std::span<const uint8_t>& piece) {
  const size_t length = SequenceLength(held_[0]);
  while (held_count_ < length && !piece.empty()) {
    held_[held_count_++] = piece.front();
    piece = piece.subspan(1);
  }
  if (held_count_ < length) return true;
  const uint8_t* next = held_.data();
  char32_t ignored = 0;
  held_count_ = 0;
  return DecodeMultibyte(next, held_.data() + length, ignored);
}

bool Utf8Scanner::Take(std::span<const uint8_t> piece) {
  if (held_count_ > 0 && !CompleteHeld(piece)) return false;
  const uint8_t* next = piece.data();
  const uint8_t* const end = next + piece.size();
  char32_t ignored = 0;
  while ((next = SkipAscii(next, end)) != end) {
    if (static_cast<size_t>(end - next) < SequenceLength(*next)) {
      held_count_ = static_cast<size_t>(end - next);
      std::copy(next, end, held_.begin());
      return true;
    }
    if (!DecodeMultibyte(next, end, ignored)) return false;
  }
  return true;
}

bool AppendCodePoints(std::string_view text, std::wstring& out) {
  static_assert(sizeof(wchar_t) == 4, "a wide character holds any code point");
  // No text has more code points than bytes: room is made once, and what is not needed given back.
  const size_t start = out.size();
  out.resize(start + text.size());
  wchar_t* next = out.data() + start;
  const bool valid =
      ForEachCodePoint(text, [&next](char32_t code_point) { *next++ = static_cast<wchar_t>(code_point); });
  out.resize(static_cast<size_t>(next - out.data()));
  return valid;
}

void AppendUtf16(std::u16string_view units, std::string& out) {
  for (size_t i = 0; i < units.size(); ++i) {
    char32_t code_point = units[i];
    if (IsHighSurrogate(code_point) && i + 1 < units.size() && IsLowSurrogate(units[i + 1])) {
      code_point = 0x10000 + ((code_point - 0xd800) << 10) + (units[++i] - 0xdc00U);
    } else if (IsHighSurrogate(code_point) || IsLowSurrogate(code_point)) {
      code_point = kReplacement;
    }
    AppendUtf8(code_point, out);
  }
}

std::string FromUtf16(std::u16string_view units) {
  std::string out;
  out.reserve(units.size());
  AppendUtf16(units, out);
  return out;
}

}  // namespace vantrel::elastic
