#pragma once

#include <zlib.h>

#include <cstdint>
#include <string>
#include <string_view>

namespace quorelastic::testing {

// Builds the bytes of an index file by hand, one primitive after the other.
class ByteWriter {
 public:
  const std::string& bytes() const { return bytes_; }
  uint64_t size() const { return bytes_.size(); }

  ByteWriter& Byte(int value) {
    bytes_.push_back(static_cast<char>(value));
    return *this;
  }
  ByteWriter& Raw(std::string_view bytes) {
    bytes_.append(bytes);
    return *this;
  }
  ByteWriter& Int(int64_t value) { return BigEndian(static_cast<uint64_t>(value), 4); }
  ByteWriter& Long(int64_t value) { return BigEndian(static_cast<uint64_t>(value), 8); }
  ByteWriter& VInt(int64_t value) { return VLong(static_cast<uint32_t>(value)); }
  ByteWriter& VLong(uint64_t value) {
    for (; value >= 0x80; value >>= 7) Byte(static_cast<int>((value & 0x7f) | 0x80));
    return Byte(static_cast<int>(value));
  }
  ByteWriter& String(std::string_view text) { return VInt(static_cast<int64_t>(text.size())).Raw(text); }

  // UTF-16 code units, each in one to three bytes, as the older layouts hold text.
  ByteWriter& Units(std::u16string_view units) {
    for (const char16_t unit : units) {
      if (unit != 0 && unit < 0x80) {
        Byte(unit);
      } else if (unit < 0x800) {
        Byte(0xc0 | unit >> 6).Byte(0x80 | (unit & 0x3f));
      } else {
        Byte(0xe0 | unit >> 12).Byte(0x80 | (unit >> 6 & 0x3f)).Byte(0x80 | (unit & 0x3f));
      }
    }
    return *this;
  }
  ByteWriter& UnitsString(std::u16string_view units) {
    return VInt(static_cast<int64_t>(units.size())).Units(units);
  }

  // The CRC-32 of everything so far.
  ByteWriter& Checksum() {
    const auto* data = reinterpret_cast<const Bytef*>(bytes_.data());
    return Long(static_cast<int64_t>(crc32(0, data, static_cast<uInt>(bytes_.size()))));
  }

 private:
  ByteWriter& BigEndian(uint64_t value, int length) {
    for (int shift = 8 * (length - 1); shift >= 0; shift -= 8) Byte(static_cast<int>(value >> shift & 0xff));
    return *this;
  }

  std::string bytes_;
};

}  // namespace quorelastic::testing
