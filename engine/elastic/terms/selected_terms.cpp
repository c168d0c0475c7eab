#include "elastic/terms/selected_terms.h"

#include <utility>

namespace vantrel::elastic {

SelectedTerms::SelectedTerms(format::SegmentFiles files, const format::TermSelection& selection)
    : files_(std::move(files)),
      fields_(format::ReadFieldInfos(files_.field_infos)),
      walk_(files_.terms, files_.terms_index, fields_, files_.info.document_count, selection) {
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

}  // namespace vantrel::elastic
