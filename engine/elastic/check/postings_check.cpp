#include "elastic/check/postings_check.h"

#include <algorithm>
#include <utility>

#include "elastic/check/mismatch.h"
#include "elastic/format/io/wide_scan.h"

namespace vantrel::elastic::check {
namespace {

constexpr size_t kPostingsBufferSize = size_t{128} << 10;
constexpr size_t kSkipsBufferSize = size_t{16} << 10;

// The usual size of a skip entry with its share of higher levels. Longer skip data are read by themselves.
constexpr size_t kUsualSkipEntry = 8;

}  // namespace

PostingsCheck::PostingsCheck(const std::shared_ptr<const format::ByteSource>& postings,
                             std::shared_ptr<const format::ByteSource> positions, int32_t document_count,
                             const format::TermCursor& dictionary)
    : postings_(postings, document_count, kPostingsBufferSize),
      skips_(postings, dictionary.skip_interval(), dictionary.most_skip_levels(), kSkipsBufferSize),
      skip_interval_(dictionary.skip_interval()),
      reads_skips_(dictionary.format() <= format::kFormatWithSkipLists) {
  if (positions != nullptr) positions_.emplace(std::move(positions), kPostingsBufferSize);
}

void PostingsCheck::Check(const format::TermCursor& dictionary, const format::FieldInfo& field) {
  const format::TermInfo& term = dictionary.info();
  has_positions_ = !field.omits_frequencies && positions_.has_value();
  has_skips_ = reads_skips_ && term.document_frequency >= skip_interval_;
  must_state_length_ = false;
  GiveSkipsBack();
  postings_.Seek(term, field.omits_frequencies);
  if (has_positions_) positions_->Seek(term.positions_pointer, field.has_payloads);
  if (has_skips_) SeekSkips(term, field.has_payloads);
  PassDocuments(term);
  postings_end_ = postings_.offset();
  positions_end_ = has_positions_ ? positions_->offset() : term.positions_pointer;
  is_end_exact_ = reads_skips_ || term.skip_offset == 0;
  if (has_skips_) CheckSkipEnds(dictionary);
}

// Most terms fit the buffer of the postings together with their skip data, which are then read from there.
void PostingsCheck::SeekSkips(const format::TermInfo& term, bool has_payloads) {
  const uint64_t pointer = term.postings_pointer + term.skip_offset;
  const auto entries = static_cast<uint64_t>(term.document_frequency / skip_interval_);
  const uint64_t length = term.skip_offset + entries * kUsualSkipEntry + format::kScanStep;
  if (length > kPostingsBufferSize) return skips_.Seek(pointer, term.document_frequency, has_payloads);
  postings_.ReadAhead(length);
  // Noted first: what throws leaves readers that have borrowed.
  borrowed_fill_ = postings_.reader().fills();
  skips_.SeekBorrowing(postings_.reader(), pointer, term.document_frequency, has_payloads);
}

void PostingsCheck::GiveSkipsBack() {
  if (borrowed_fill_.has_value()) skips_.GiveBack();
  borrowed_fill_.reset();
}

void PostingsCheck::PassDocuments(const format::TermInfo& term) {
  // A skip entry describes the place before each n-th document.
  int32_t next_skip = has_skips_ ? skip_interval_ - 1 : term.document_frequency;
  for (int32_t passed = 0; passed < term.document_frequency;) {
    const int32_t block = std::min(std::min(next_skip, term.document_frequency) - passed,
                                   format::PostingsReader::kLongestBlock);
    postings_.PassBlock(block);
    if (has_positions_) PassPositions();
    if (borrowed_fill_ != postings_.reader().fills()) GiveSkipsBack();
    passed += block;
    if (passed != next_skip || passed == term.document_frequency) continue;
    CompareSkips(term, passed + 1);
    next_skip += std::min(skip_interval_, term.document_frequency - next_skip);
  }
}

void PostingsCheck::PassPositions() {
  if (!must_state_length_) return positions_->PassBlock(postings_);
  must_state_length_ = false;
  bool at_first = true;
  for (const uint32_t frequency : postings_.BlockFrequencies()) {
    positions_->PassDocument(frequency);
    if (at_first && !positions_->states_length()) {
      Refuse(Grade::kUnsafe, positions_->name(), positions_->offset(),
             "the length of the payload that a skip entry leads to", "that of the one before");
    }
    at_first = false;
  }
}

// The cursors stand before the document of that number, counted from 1.
void PostingsCheck::CompareSkips(const format::TermInfo& term, int32_t number) {
  uint64_t child = 0;
  for (int level = 0; level < skips_.levels() && number % skip_interval_ == 0; ++level) {
    const format::SkipListReader::Entry& entry = skips_.Next(level);
    CompareSkip(term, level, entry);
    if (level > 0) {
      RequireEqual(Grade::kUnsafe, postings_.name(), entry.offset, "skip entry's place in the level below",
                   child, entry.child);
    }
    child = entry.end;
    number /= skip_interval_;
  }
}

void PostingsCheck::CompareSkip(const format::TermInfo& term, int level,
                                const format::SkipListReader::Entry& entry) {
  const std::string& file = postings_.name();
  RequireEqual(Grade::kUnsafe, file, entry.offset, "skip entry for document",
               static_cast<uint32_t>(postings_.document()), entry.document);
  RequireEqual(Grade::kUnsafe, file, entry.offset, "skip entry's distance in the postings",
               static_cast<uint32_t>(postings_.offset() - term.postings_pointer),
               static_cast<uint32_t>(entry.postings_distance));
  const uint64_t positions = has_positions_ ? positions_->offset() - term.positions_pointer : 0;
  RequireEqual(Grade::kUnsafe, file, entry.offset, "skip entry's distance in the positions",
               static_cast<uint32_t>(positions), static_cast<uint32_t>(entry.positions_distance));
  if (!has_positions_ || level > 0 || !positions_->payload_length().has_value()) return;
  const uint32_t length = *positions_->payload_length();
  if (entry.payload_length.has_value()) {
    RequireEqual(Grade::kUnsafe, file, entry.offset, "skip entry's payload length", length,
                 *entry.payload_length);
  } else {
    must_state_length_ = length != 0;
  }
}

void PostingsCheck::CheckSkipEnds(const format::TermCursor& dictionary) {
  const format::TermInfo& term = dictionary.info();
  RequireEqual(Grade::kUnsafe, dictionary.name(), dictionary.offset(), "term with skip data at",
               postings_end_ - term.postings_pointer, term.skip_offset);
  for (int level = 1; level < skips_.levels(); ++level) {
    RequireEqual(Grade::kUnsafe, postings_.name(), skips_.offset(level), "skip level to end at",
                 skips_.offset(level), skips_.end(level));
  }
  postings_end_ = skips_.offset(0);
}

}  // namespace vantrel::elastic::check
