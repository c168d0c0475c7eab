#include "vantrel/elastic/index_info.h"

#include <limits>
#include <stdexcept>
#include <utility>

#include "elastic/format/segment/term_cursor.h"
#include "elastic/segment/segment_files.h"
#include "elastic/terms/term_walk.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

constexpr uint64_t kSuggestBudget = uint64_t{64} << 20;

// A loaded index term: its two objects, their reference counts and pointers, and four bytes a character.
constexpr uint64_t kBytesPerTerm = 256;
constexpr uint64_t kBytesPerCharacter = 4;

struct TermsIndexSize {
  uint64_t terms;
  uint64_t bytes;
};

TermsIndexSize SizeOf(const format::SegmentFiles& files) {
  const format::TermCursor cursor(files.terms_index, format::TermCursor::File::kIndex,
                                  std::numeric_limits<int32_t>::max(), files.info.document_count);
  return {cursor.count(), files.terms_index->size()};
}

uint64_t LoadedBytes(const TermsIndexSize& size, uint64_t divisor) {
  const uint64_t loaded = (size.terms + divisor - 1) / divisor;
  const uint64_t bytes = size.bytes / divisor;
  // What is over the budget anyway is not multiplied further: a file with a hole may announce any size.
  if (loaded > kSuggestBudget || bytes > kSuggestBudget) return kSuggestBudget;
  return loaded * kBytesPerTerm + bytes * kBytesPerCharacter;
}

}  // namespace

IndexInfo::IndexInfo(const std::string& path) : path_(path) {}

IndexInfo::~IndexInfo() = default;

void IndexInfo::initialize() {
  const format::DiskFolder folder(path_);
  try {
    segments_ = format::OpenNewestSegments(folder, format::Need::kAll);
  } catch (const IndexError&) {
    // It is no writer that took the file away, or a newer commit had been found. What all terms are can be told
    // without knowing which documents are deleted.
    segments_ = format::OpenNewestSegments(folder, format::Need::kTerms);
  }
}

int IndexInfo::GetSegmentNum() const { return static_cast<int>(segments_.size()); }

std::shared_ptr<TermDict> IndexInfo::GetTermDict(int segment, bool live_only) const {
  if (segment < 0 || segment >= GetSegmentNum()) {
    throw std::out_of_range("segment " + std::to_string(segment) + " of " + std::to_string(GetSegmentNum()));
  }
  return std::make_shared<TermDict>(
      std::make_unique<TermWalk>(segments_[static_cast<size_t>(segment)], live_only));
}

int IndexInfo::GetSuggestDivisor() const {
  std::vector<TermsIndexSize> sizes;
  sizes.reserve(segments_.size());
  for (const format::SegmentFiles& files : segments_) sizes.push_back(SizeOf(files));
  constexpr int kLargest = 1 << 30;
  for (int divisor = 1; divisor < kLargest; divisor *= 2) {
    uint64_t total = 0;
    for (const TermsIndexSize& size : sizes) total += LoadedBytes(size, static_cast<uint64_t>(divisor));
    if (total < kSuggestBudget) return divisor;
  }
  return kLargest;
}

}  // namespace vantrel::elastic
