#include "elastic/format/segment/positions.h"

#include <string>
#include <utility>

namespace vantrel::elastic::format {

PositionsReader::PositionsReader(std::shared_ptr<const ByteSource> source, size_t buffer_size)
    : reader_(std::move(source), buffer_size) {}

void PositionsReader::Seek(uint64_t pointer, bool has_payloads, std::optional<uint32_t> payload_length) {
  reader_.Seek(pointer);
  has_payloads_ = has_payloads;
  payload_length_ = payload_length;
  states_length_ = false;
}

int32_t PositionsReader::Advanced(int32_t position, int32_t least, uint32_t distance, uint64_t start) const {
  const auto next = static_cast<int32_t>(static_cast<uint32_t>(position) + distance);
  if (next < least) {
    reader_.Damaged(start, "position " + std::to_string(next) + " follows " + std::to_string(least));
  }
  return next;
}

void PositionsReader::PassBlock(PostingsReader& postings) {
  // Distances of three bytes are below 2^21: so few of them neither wrap nor descend.
  constexpr uint32_t kFew = 1 << 10;
  if (!has_payloads_ && postings.block_bound() < kFew) {
    const uint64_t start = reader_.offset();
    if (reader_.PassShortVInts(postings.block_occurrences())) return;
    reader_.Seek(start);
  }
  for (const uint32_t frequency : postings.BlockFrequencies()) PassDocument(frequency);
}

void PositionsReader::PassPlain(uint32_t frequency) {
  int32_t position = 0;
  int32_t least = -1;
  for (; frequency > 0; --frequency) {
    const uint64_t start = reader_.offset();
    position = least = Advanced(position, least, reader_.ReadVInt(), start);
  }
}

void PositionsReader::PassPayloads(uint32_t frequency) {
  int32_t position = 0;
  int32_t least = -1;
  states_length_ = false;
  for (uint32_t i = 0; i < frequency; ++i) {
    const uint64_t start = reader_.offset();
    const uint32_t code = reader_.ReadVInt();
    position = least = Advanced(position, least, code >> 1, start);
    if ((code & 1) != 0) {
      payload_length_ = reader_.ReadVInt();
      states_length_ = states_length_ || i == 0;
    }
    if (!payload_length_.has_value()) {
      reader_.Damaged(start, "the length of the term's first payload is not stated");
    }
    reader_.Skip(*payload_length_);
  }
}

}  // namespace vantrel::elastic::format
