#pragma once

#include <zlib.h>

#include <cstdint>
#include <functional>
#include <span>

namespace vantrel::elastic::format {

// Inflates zlib streams that come in pieces, into pieces of at most 4 KiB. How long a stream may become is for the
// caller to bound: a stream inflates to as much as 1,032 times its size. For one thread at a time.
class Inflater {
 public:
  // Throws std::bad_alloc.
  Inflater();
  Inflater(const Inflater&) = delete;
  Inflater& operator=(const Inflater&) = delete;
  ~Inflater();

  // Begins another stream.
  void Restart();

  // Hands what comes out of a piece to `take`, which may throw. False where the stream is damaged, has ended before
  // the piece has, or `take` returned false.
  bool Take(std::span<const uint8_t> piece, const std::function<bool(std::span<const uint8_t>)>& take);

  // Whether the stream has come to its end.
  bool IsComplete() const { return complete_; }

 private:
  z_stream stream_{};
  bool complete_ = false;
};

}  // namespace vantrel::elastic::format
