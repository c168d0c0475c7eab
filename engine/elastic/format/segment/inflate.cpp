#include "elastic/format/segment/inflate.h"

#include <array>
#include <new>

namespace vantrel::elastic::format {

Inflater::Inflater() {
  if (inflateInit(&stream_) != Z_OK) throw std::bad_alloc();
}

Inflater::~Inflater() { inflateEnd(&stream_); }

void Inflater::Restart() {
  inflateReset(&stream_);
  complete_ = false;
}

bool Inflater::Take(std::span<const uint8_t> piece,
                    const std::function<bool(std::span<const uint8_t>)>& take) {
  std::array<uint8_t, 4096> out;
  stream_.next_in = const_cast<Bytef*>(piece.data());
  stream_.avail_in = static_cast<uInt>(piece.size());
  do {
    if (complete_) return stream_.avail_in == 0;
    stream_.next_out = out.data();
    stream_.avail_out = static_cast<uInt>(out.size());
    const int result = inflate(&stream_, Z_NO_FLUSH);
    if (result != Z_OK && result != Z_STREAM_END && result != Z_BUF_ERROR) return false;
    complete_ = result == Z_STREAM_END;
    if (!take(std::span(out).first(out.size() - stream_.avail_out))) return false;
  } while (stream_.avail_in > 0 || stream_.avail_out == 0);
  return true;
}

}  // namespace vantrel::elastic::format
