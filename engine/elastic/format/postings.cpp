#include "elastic/format/postings.h"

#include <string>
#include <utility>

namespace vantrel::elastic::format {

PostingsReader::PostingsReader(std::shared_ptr<const ByteSource> source, int32_t document_count)
    : reader_(std::move(source)), document_count_(static_cast<uint32_t>(document_count)) {}

void PostingsReader::Seek(const TermInfo& term, bool omits_frequencies) {
  reader_.Seek(term.postings_pointer);
  omits_frequencies_ = omits_frequencies;
  left_ = term.document_frequency;
  at_first_ = true;
  document_ = 0;
}

bool PostingsReader::Next() {
  if (left_ == 0) return false;
  const uint64_t start = reader_.offset();
  const uint32_t code = reader_.ReadVInt();
  const uint32_t distance = omits_frequencies_ ? code : code >> 1;
  const bool once = omits_frequencies_ || (code & 1) != 0;
  frequency_ = once ? 1 : reader_.ReadVInt();
  const auto before = static_cast<uint32_t>(document_);
  if ((distance == 0 && !at_first_) || distance >= document_count_ - before) {
    reader_.Damaged(start, "posting lies " + std::to_string(distance) + " after document " +
                               std::to_string(before) + " of " + std::to_string(document_count_));
  }
  if (frequency_ == 0) reader_.Damaged(start, "posting has frequency 0");
  document_ = static_cast<int32_t>(before + distance);
  at_first_ = false;
  --left_;
  return true;
}

}  // namespace vantrel::elastic::format
