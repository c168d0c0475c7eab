#include "elastic/terms/selected_terms.h"

#include <algorithm>
#include <string>
#include <utility>

#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

SelectedTerms::SelectedTerms(format::SegmentFiles files, const format::TermSelection& selection,
                             size_t buffer_size)
    : files_(std::move(files)),
      fields_(format::ReadFieldInfos(files_.field_infos)),
      walk_(files_.terms, files_.terms_index, fields_, files_.info.document_count, selection, buffer_size) {
  // Others want descriptors, too.
  files_.field_infos.reset();
  files_.terms_index.reset();
}

LiveTermFilter& SelectedTerms::live_filter() {
  if (!live_filter_.has_value()) live_filter_.emplace(files_);
  return *live_filter_;
}

bool SelectedTerms::IsLiveAtFirstSight(const format::TermInfo& term) {
  return files_.deletions == nullptr || live_filter().IsLiveAtFirstSight(term);
}

bool SelectedTerms::IsLive(const format::TermInfo& term, int32_t field) {
  return files_.deletions == nullptr ||
         live_filter().IsLive(term, fields_[static_cast<size_t>(field)].omits_frequencies);
}

void AddSelectedTerms(std::vector<format::SegmentFiles> files, const format::TermSelection& selection,
                      std::vector<std::unique_ptr<SelectedTerms>>& segments) {
  // Of all segments together, as far as a smaller one makes no more reads than terms.
  constexpr size_t kBuffers = size_t{16} << 20;
  constexpr size_t kSmallestBuffer = size_t{4} << 10;
  const size_t buffer_size = std::clamp(kBuffers / std::max<size_t>(files.size(), 1), kSmallestBuffer,
                                        format::TermCursor::kDefaultBufferSize);
  size_t room = 0;
  for (format::SegmentFiles& segment : files) {
    const std::string name = segment.terms->name();
    segments.push_back(std::make_unique<SelectedTerms>(std::move(segment), selection, buffer_size));
    room += segments.back()->walk().TextRoom();
    if (room > kMostTextRoom) {
      throw IndexDamagedError(name, 0, "the terms of the segments up to this one are too long to be merged");
    }
  }
}

}  // namespace vantrel::elastic
