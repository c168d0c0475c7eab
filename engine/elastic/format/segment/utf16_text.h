#pragma once

#include <cstdint>
#include <string>

#include "elastic/common/text.h"
#include "elastic/format/io/byte_reader.h"

namespace vantrel::elastic::format {

// Appends `count` UTF-16 code units in the older layouts' encoding, each in one to three bytes: 0xxxxxxx,
// 110xxxxx 10xxxxxx or 1110xxxx 10xxxxxx 10xxxxxx. Nothing is allocated ahead of the bytes that are there.
inline void ReadUtf16Units(ByteReader& reader, uint32_t count, std::u16string& out) {
  if (count > reader.remaining()) {
    reader.Damaged(reader.offset(), "text of " + std::to_string(count) +
                                        " characters reaches past the end of the file at " +
                                        std::to_string(reader.size()));
  }
  if (out.size() + count > kLongestText) {
    reader.Damaged(reader.offset(),
                   "text of " + std::to_string(out.size() + count) + " characters is too long");
  }
  for (; count > 0; --count) {
    const uint64_t start = reader.offset();
    const auto continuation = [&] {
      const uint8_t byte = reader.ReadByte();
      if ((byte & 0xc0) != 0x80)
        reader.Damaged(start, "character is not encoded as its first byte announces");
      return byte & 0x3fU;
    };
    uint32_t unit = reader.ReadByte();
    if (unit >= 0xe0) {
      const uint32_t high = (unit & 0x0fU) << 12;
      const uint32_t middle = continuation() << 6;
      unit = high | middle | continuation();
    } else if (unit >= 0x80) {
      unit = (unit & 0x1fU) << 6 | continuation();
    }
    out.push_back(static_cast<char16_t>(unit));
  }
}

}  // namespace vantrel::elastic::format
