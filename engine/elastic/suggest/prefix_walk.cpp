#include "elastic/suggest/prefix_walk.h"

#include <algorithm>
#include <utility>

namespace vantrel::elastic {

PrefixWalk::PrefixWalk(format::SegmentFiles files, const std::string& field, std::string prefix)
    : files_(std::move(files)),
      prefix_(std::move(prefix)),
      fields_(format::ReadFieldInfos(files_.field_infos)),
      sides_(SidesOf(field)),
      cursor_(OpenCursor()) {
  if (std::find(sides_.begin(), sides_.end(), Side::kHere) == sides_.end()) {
    at_end_ = true;
  } else {
    SeekByIndex();
  }
}

std::vector<PrefixWalk::Side> PrefixWalk::SidesOf(const std::string& field) const {
  std::vector<Side> sides;
  sides.reserve(fields_.size());
  for (const format::FieldInfo& info : fields_) {
    const int order = info.name.compare(field);
    sides.push_back(order < 0 ? Side::kBefore : order == 0 ? Side::kHere : Side::kBehind);
  }
  return sides;
}

format::TermCursor PrefixWalk::OpenCursor() const {
  return format::TermCursor(files_.terms, format::TermCursor::File::kDictionary,
                            static_cast<uint32_t>(fields_.size()), files_.info.document_count);
}

// Dictionaries are sorted by the fields' names, then by text. UTF-8 sorts by its bytes as by its code points.
bool PrefixWalk::IsBefore(const format::TermCursor& cursor) const {
  if (cursor.field() < 0) return true;  // the first entry of an index
  const Side side = sides_[static_cast<size_t>(cursor.field())];
  return side == Side::kHere ? cursor.text() < prefix_ : side == Side::kBefore;
}

// Entry k of the index tells where term k times the interval begins, and what stands before it.
void PrefixWalk::SeekByIndex() {
  format::TermCursor index(files_.terms_index, format::TermCursor::File::kIndex,
                           static_cast<uint32_t>(fields_.size()), files_.info.document_count);
  format::TermPlace place;
  uint64_t entries = 0;
  while (index.Next() && IsBefore(index)) {
    index.CopyPlace(place);
    ++entries;
  }
  if (entries > 0) cursor_.Resume(place, (entries - 1) * static_cast<uint64_t>(cursor_.index_interval()));
}

bool PrefixWalk::Next() {
  while (!at_end_ && cursor_.Next()) {
    if (sides_[static_cast<size_t>(cursor_.field())] == Side::kHere && text().starts_with(prefix_)) {
      CheckOrder();
      return true;
    }
    at_end_ = !IsBefore(cursor_);
  }
  at_end_ = true;
  return false;
}

// Terms of several segments are merged by their order. The older layouts are sorted by something else where their
// texts go beyond 16 bits.
void PrefixWalk::CheckOrder() {
  if (!cursor_.is_utf8()) return;
  if (has_previous_ && text() <= previous_) Damaged("term does not come after the one before it");
  previous_ = text();
  has_previous_ = true;
}

LiveTermFilter& PrefixWalk::live_filter() {
  if (!live_filter_.has_value()) live_filter_.emplace(files_);
  return *live_filter_;
}

bool PrefixWalk::IsLiveAtFirstSight() {
  return files_.deletions == nullptr || live_filter().IsLiveAtFirstSight(cursor_.info());
}

bool PrefixWalk::IsLive() {
  return files_.deletions == nullptr ||
         live_filter().IsLive(cursor_.info(),
                              fields_[static_cast<size_t>(cursor_.field())].omits_frequencies);
}

}  // namespace vantrel::elastic
