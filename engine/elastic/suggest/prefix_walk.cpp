#include "elastic/suggest/prefix_walk.h"

#include <utility>

namespace vantrel::elastic {

PrefixWalk::PrefixWalk(format::SegmentFiles files, const std::string& field, std::string prefix)
    : files_(std::move(files)),
      fields_(format::ReadFieldInfos(files_.field_infos)),
      order_(fields_, field, std::move(prefix)),
      passed_(order_),
      cursor_(OpenCursor(files_.terms, format::TermCursor::File::kDictionary)) {
  if (order_.has_field()) SeekByIndex();
  // Others want descriptors, too.
  files_.field_infos.reset();
  files_.terms_index.reset();
}

format::TermCursor PrefixWalk::OpenCursor(const std::shared_ptr<const format::ByteSource>& source,
                                          format::TermCursor::File file) const {
  return format::TermCursor(source, file, static_cast<uint32_t>(fields_.size()), files_.info.document_count);
}

void PrefixWalk::SeekByIndex() {
  format::TermCursor index = OpenCursor(files_.terms_index, format::TermCursor::File::kIndex);
  for (DictionaryPart& part : FindDictionaryParts(cursor_, index, order_)) {
    while (Advance()) {
    }
    Begin(std::move(part));
  }
}

void PrefixWalk::Begin(DictionaryPart part) {
  part_ = std::move(part);
  if (part_.begin_number > 0) {
    cursor_.Resume(part_.begin, part_.begin_number);
    passed_.StartBehind(part_.begin, part_.begin_text);
  }
  number_ = part_.begin_number;
  entries_ = {};
  at_end_ = false;
}

bool PrefixWalk::Next() {
  while (Advance()) {
    if (order_.SideOf(cursor_) == TermOrder::Side::kHere) return true;
  }
  return false;
}

// To the next term of the part, and behind its last one to the place that the index tells.
bool PrefixWalk::Advance() {
  if (at_end_) return false;
  const bool has_next = cursor_.Next();
  if (has_next) CheckEntry();
  if (!has_next || number_ == part_.end_number) {
    at_end_ = true;
    CheckEntries();
    return false;
  }
  passed_.Check(cursor_);
  ++number_;
  return true;
}

// Before the term at the cursor an entry of the index may stand.
void PrefixWalk::CheckEntry() {
  if (number_ % static_cast<uint64_t>(cursor_.index_interval()) != 0) return;
  if (number_ == part_.begin_number && number_ != 0) return;
  entries_.Add(passed_.text(), passed_.field(), passed_.info(), cursor_.index_repeats_skips(),
               cursor_.offset());
}

void PrefixWalk::CheckEntries() const {
  if (entries_ != part_.entries) {
    cursor_.Damaged("terms up to here are not those that the index over the dictionary repeats");
  }
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
