#pragma once

#include <zlib.h>

#include <cstdint>
#include <functional>
#include <span>

namespace vantrel::elastic::format {

// Inflates one zlib stream that comes in pieces, into pieces of bounded size. For one thread at a time.
class Inflater {
 public:
  // Throws std::bad_alloc.
  Inflater();
  Inflater(const Inflater&) = delete;
  Inflater& operator=(const Inflater&) = delete;
  ~Inflater();

  // Hands what comes out of a piece to `take`. False where the stream is damaged, has ended before the piece has,
  // or `take` returned false.
  bool Take(std::span<const uint8_t> piece, const std::function<bool(std::span<const uint8_t>)>& take);

  // Whether the stream has come to its end.
  bool IsComplete() const { return complete_; }

 private:
  z_stream stream_{};
  bool complete_ = false;
};

}  // namespace vantrel::elastic::format
