#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

#include "elastic/format/segment/field_infos.h"
#include "elastic/segment/dictionary_walk.h"
#include "elastic/segment/segment_files.h"
#include "elastic/terms/live_term_filter.h"

namespace vantrel::elastic {

// The terms of a selection in one segment, in the dictionary's order, by a DictionaryWalk, and which of them a document
// holds that is not deleted. Of the segment's files it holds the dictionary open and, where documents are deleted, what
// tells of them. For one thread at a time. Everything may throw IndexError, and what
// reading the files throws.
class SelectedTerms {
 public:
  using Move = format::DictionaryWalk::Move;

  SelectedTerms(format::SegmentFiles files, const format::TermSelection& selection,
                size_t buffer_size = format::TermCursor::kDefaultBufferSize);

  Move Step() { return walk_.Step(); }
  const format::DictionaryWalk& walk() const { return walk_; }
  const std::vector<format::FieldInfo>& fields() const { return fields_; }

  // Whether a document holds the term that is not deleted. False from the first of them leaves it open; the second
  // knows, but may have to read postings.
  bool IsLiveAtFirstSight(const format::TermInfo& term);
  bool IsLive(const format::TermInfo& term, int32_t field);

  // Gives back the memory that IsLive() has taken for pages of deleted documents.
  void ReleasePages() {
    if (live_filter_.has_value()) live_filter_->ReleasePages();
  }

 private:
  LiveTermFilter& live_filter();

  format::SegmentFiles files_;
  std::vector<format::FieldInfo> fields_;
  format::DictionaryWalk walk_;
  // Made when it is first asked: it reads the whole deletions file.
  std::optional<LiveTermFilter> live_filter_;
};

// What the texts of all segments that are read together may take, in bytes as DictionaryWalk counts them.
inline constexpr size_t kMostTextRoom = size_t{12} << 20;

// Appends the terms of a selection in some segments. Throws IndexDamagedError where the texts take more than
// kMostTextRoom.
void AddSelectedTerms(std::vector<format::SegmentFiles> files, const format::TermSelection& selection,
                      std::vector<std::unique_ptr<SelectedTerms>>& segments);

}  // namespace vantrel::elastic
