#include "elastic/format/text.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace vantrel::elastic::format {
namespace {

constexpr char32_t kReplacement = 0xfffd;

bool IsHighSurrogate(char32_t unit) { return unit >= 0xd800 && unit <= 0xdbff; }
bool IsLowSurrogate(char32_t unit) { return unit >= 0xdc00 && unit <= 0xdfff; }

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

// Moves past ASCII, eight bytes at a time.
const uint8_t* SkipAscii(const uint8_t* next, const uint8_t* end) {
  while (end - next >= 8) {
    uint64_t eight = 0;
    std::memcpy(&eight, next, sizeof eight);
    if ((eight & 0x8080808080808080U) != 0) break;
    next += 8;
  }
  while (next != end && *next < 0x80) ++next;
  return next;
}

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

bool IsValidUtf8(std::string_view text) {
  const auto* next = reinterpret_cast<const uint8_t*>(text.data());
  const uint8_t* const end = next + text.size();
  char32_t ignored = 0;
  while ((next = SkipAscii(next, end)) != end) {
    if (!DecodeMultibyte(next, end, ignored)) return false;
  }
  return true;
}

bool IsKeptText(std::string_view text) {
  const auto* next = reinterpret_cast<const uint8_t*>(text.data());
  const uint8_t* const end = next + text.size();
  char32_t code_point = 0;
  while ((next = SkipAscii(next, end)) != end) {
    if (!DecodeMultibyte(next, end, code_point)) return false;
    if (code_point == 0xfffe || code_point == 0xffff || code_point == 0x1ffff) return false;
  }
  return true;
}

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

std::string FromUtf16(std::u16string_view units) {
  std::string out;
  out.reserve(units.size());
  for (size_t i = 0; i < units.size(); ++i) {
    char32_t code_point = units[i];
    if (IsHighSurrogate(code_point) && i + 1 < units.size() && IsLowSurrogate(units[i + 1])) {
      code_point = 0x10000 + ((code_point - 0xd800) << 10) + (units[++i] - 0xdc00U);
    } else if (IsHighSurrogate(code_point) || IsLowSurrogate(code_point)) {
      code_point = kReplacement;
    }
    AppendUtf8(code_point, out);
  }
  return out;
}

}  // namespace vantrel::elastic::format
