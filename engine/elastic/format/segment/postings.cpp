#include "elastic/format/segment/postings.h"

#include <string>
#include <utility>

#include "elastic/format/io/wide_scan.h"

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

void PostingsReader::Resume(uint64_t pointer, int32_t document, int32_t left, bool omits_frequencies) {
  reader_.Seek(pointer);
  omits_frequencies_ = omits_frequencies;
  left_ = left;
  at_first_ = false;
  document_ = document;
}

namespace {

constexpr size_t kLongestPosting = 10;  // bytes
constexpr int32_t kFewDocuments = 3;    // are passed sooner one by one than at once

// Goes on with a VInt whose first two bytes announce more; `is_long` where it takes five bytes or more.
inline const uint8_t* FinishVInt(const uint8_t* next, uint32_t& value, bool& is_long) {
  value |= static_cast<uint32_t>(*next & 0x7f) << 14;
  if (*next++ < 0x80) return next;
  value |= static_cast<uint32_t>(*next & 0x7f) << 21;
  if (*next++ >= 0x80) is_long = true;
  return next;
}

// A VInt of which the byte behind it may be read too. One byte or two are told without a jump, which the processor
// would often guess wrong.
inline const uint8_t* TakeVInt(const uint8_t* next, uint32_t& value, bool& is_long) {
  const uint32_t first = next[0];
  const uint32_t second = next[1];
  const uint32_t has_second = first >> 7;
  value = (first & 0x7f) | ((second & 0x7f) << 7 & -has_second);
  if ((has_second & second >> 7) != 0) return FinishVInt(next + 2, value, is_long);
  return next + 1 + has_second;
}

}  // namespace

// Decodes without looking at each number, and only then whether all were good. False, having done nothing, where they
// were not, or are such that only Next() can tell.
template <bool kOmitsFrequencies>
bool PostingsReader::PassQuickly(int32_t count) {
  const auto window = reader_.Window(static_cast<size_t>(count) * kLongestPosting);
  if (window.size() < static_cast<size_t>(count) * kLongestPosting) return false;
  const uint8_t* next = window.data();
  uint32_t* const frequencies = frequencies_.data() + block_count_;
  uint64_t document = static_cast<uint32_t>(document_);
  uint64_t occurrences = 0;
  uint32_t bound = 0;
  bool is_bad = false;
  for (int32_t i = 0; i < count; ++i) {
    uint32_t code = 0;
    next = TakeVInt(next, code, is_bad);
    uint32_t distance = code;
    uint32_t frequency = 1;
    if constexpr (!kOmitsFrequencies) {
      distance = code >> 1;
      if ((code & 1) == 0) {
        frequency = *next;  // nearly always all of it
        next = frequency < 0x80 ? next + 1 : TakeVInt(next, frequency, is_bad);
      }
    }
    is_bad = is_bad || distance == 0 || frequency == 0;
    document += distance;
    frequencies[i] = frequency;
    occurrences += frequency;
    bound |= frequency;
  }
  if (is_bad || document >= document_count_) return false;
  reader_.Advance(static_cast<size_t>(next - window.data()));
  document_ = static_cast<int32_t>(document);
  left_ -= count;
  block_count_ += count;
  block_occurrences_ += occurrences;
  block_bound_ |= bound;
  return true;
}

// Adds up postings without decoding each number. Returns how many of `count` documents it has passed. It leaves what is
// rare or damaged to the other ways.
int32_t PostingsReader::PassWide(int32_t count) {
  const auto window = reader_.Window(kScanStep);
  const uint8_t* next = window.data();
  const PostingsRun run = PassPostings(BestScanInstructions(), next, window.data() + window.size(), count);
  const uint64_t document = static_cast<uint32_t>(document_) + run.distance;
  if (run.documents == 0 || document >= document_count_) return 0;
  reader_.Advance(static_cast<size_t>(next - window.data()));
  document_ = static_cast<int32_t>(document);
  left_ -= run.documents;
  at_first_ = false;
  block_count_ = run.documents;
  block_occurrences_ = run.occurrences;
  block_bound_ = kMostScannedFrequency;
  knows_frequencies_ = false;
  return run.documents;
}

void PostingsReader::PassBlock(int32_t count) {
  block_start_ = {reader_.offset(), left_, at_first_, document_};
  block_count_ = 0;
  block_occurrences_ = 0;
  block_bound_ = 0;
  knows_frequencies_ = true;
  if (count <= kFewDocuments) return PassOneByOne(count);
  if (!omits_frequencies_) {
    const int32_t passed = PassWide(count);
    if (passed == count) return;
    count -= passed;
  }
  // The first one may be document 0, at no distance.
  if (at_first_) {
    PassOneByOne(1);
    --count;
  }
  if (omits_frequencies_ ? PassQuickly<true>(count) : PassQuickly<false>(count)) return;
  PassOneByOne(count);
}

void PostingsReader::PassOneByOne(int32_t count) {
  for (; count > 0 && Next(); --count) {
    frequencies_[static_cast<size_t>(block_count_++)] = frequency_;
    block_occurrences_ += frequency_;
    block_bound_ |= frequency_;
  }
}

std::span<const uint32_t> PostingsReader::BlockFrequencies() {
  if (!knows_frequencies_) {
    const int32_t count = std::exchange(block_count_, 0);
    reader_.Seek(block_start_.offset);
    left_ = block_start_.left;
    at_first_ = block_start_.at_first;
    document_ = block_start_.document;
    block_occurrences_ = 0;
    block_bound_ = 0;
    PassOneByOne(count);
    knows_frequencies_ = true;
  }
  return std::span(frequencies_).first(static_cast<size_t>(block_count_));
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
