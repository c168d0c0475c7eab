#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

// The framing that both ends of a socket speak. One message is
//
//   4 bytes   length of what follows, unsigned, big-endian
//   length    payload: by convention a JSON text in UTF-8, by right any bytes
//
// There is no terminator and no alignment; messages follow one another without a gap. A length above
// kLongestMessage breaks the connection: what comes after it cannot be told apart any more.
namespace quordaemon {

inline constexpr size_t kHeaderSize = 4;
inline constexpr uint32_t kLongestMessage = 64U << 20;

using Header = std::array<uint8_t, kHeaderSize>;

// `length` must be kLongestMessage at most.
constexpr Header EncodeHeader(uint32_t length) {
  return {static_cast<uint8_t>(length >> 24), static_cast<uint8_t>(length >> 16),
          static_cast<uint8_t>(length >> 8), static_cast<uint8_t>(length)};
}

// The announced length, to be checked against kLongestMessage before anything is done with it.
constexpr uint32_t DecodeHeader(const Header& header) {
  return static_cast<uint32_t>(header[0]) << 24 | static_cast<uint32_t>(header[1]) << 16 |
         static_cast<uint32_t>(header[2]) << 8 | static_cast<uint32_t>(header[3]);
}

}  // namespace quordaemon
