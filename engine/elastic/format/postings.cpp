#include "elastic/format/postings.h"

#include <string>
#include <utility>

namespace vantrel::elastic::format {

PostingsReader::PostingsReader(std::shared_ptr<const ByteSource> source, int32_t document_count,
                               size_t buffer_size)
    : reader_(std::move(source), buffer_size), document_count_(static_cast<uint32_t>(document_count)) {}

void PostingsReader::Seek(const TermInfo& term, bool omits_frequencies) {
  reader_.Seek(term.postings_pointer);
  omits_frequencies_ = omits_frequencies;
  left_ = term.document_frequency;
  at_first_ = true;
  document_ = 0;
}

void PostingsReader::Refuse(uint32_t distance) const {
  const auto before = static_cast<uint32_t>(document_);
  if ((distance == 0 && !at_first_) || distance >= document_count_ - before) {
    reader_.Damaged(start_, "posting lies " + std::to_string(distance) + " after document " +
                                std::to_string(before) + " of " + std::to_string(document_count_));
  }
  reader_.Damaged(start_, "posting has frequency 0");
}

}  // namespace vantrel::elastic::format
