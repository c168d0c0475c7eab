#pragma once

#include <cstdint>
#include <memory>
#include <optional>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/postings.h"

namespace vantrel::elastic::format {

// The positions of a term in its documents (.prx), and the payloads at them. Layout, at the term's positions
// pointer, for each document as many times as its frequency says:
//
//   VInt distance from the position before (the first: from 0)
//   where the field has payloads: VInt twice the distance, plus 1 where the payload's length is stated
//     VInt that length, else it is the one before; then so many bytes
//
// Fields that omit frequencies have none. Numbers are of 32 bits, signed, and wrap; a document's first position
// may be -1. For one thread at a time.
class PositionsReader {
 public:
  PositionsReader(std::shared_ptr<const ByteSource> source,
                  size_t buffer_size = ByteReader::kDefaultBufferSize);

  // Moves before the first document of a term, or before a later one, where skip data tell the payload length that
  // holds there. Throws IndexDamagedError, IndexIoError, as does PassDocument().
  void Seek(uint64_t pointer, bool has_payloads, std::optional<uint32_t> payload_length = std::nullopt);

  // Moves past one document's positions. They must not descend, nor lie before -1.
  void PassDocument(uint32_t frequency) { has_payloads_ ? PassPayloads(frequency) : PassPlain(frequency); }

  // Moves past the positions of the documents of a block.
  void PassBlock(PostingsReader& postings);

  // The length of the last payload; nothing before the term's first one.
  std::optional<uint32_t> payload_length() const { return payload_length_; }
  // Whether the document that was passed last began by stating the length of its first payload.
  bool states_length() const { return states_length_; }

  uint64_t offset() const { return reader_.offset(); }
  uint64_t size() const { return reader_.size(); }
  const std::string& name() const { return reader_.name(); }

 private:
  void PassPlain(uint32_t frequency);
  void PassPayloads(uint32_t frequency);
  int32_t Advanced(int32_t position, int32_t least, uint32_t distance, uint64_t start) const;

  ByteReader reader_;
  bool has_payloads_ = false;
  std::optional<uint32_t> payload_length_;
  bool states_length_ = false;
};

}  // namespace vantrel::elastic::format
