#include "elastic/terms/term_walk.h"

#include <lucene++/LuceneHeaders.h>

#include <algorithm>
#include <exception>
#include <utility>

#include "elastic/common/text.h"

namespace vantrel::elastic {

TermWalk::TermWalk(format::SegmentFiles files, bool live_only)
    : files_(std::move(files)), fields_(format::ReadFieldInfos(files_.field_infos)), cursor_(OpenCursor()) {
  if (live_only && files_.liveness_failure != nullptr) std::rethrow_exception(files_.liveness_failure);
  if (live_only && files_.deletions != nullptr) {
    live_filter_.emplace(files_);
  } else {
    count_ = cursor_.count();
  }
}

format::TermCursor TermWalk::OpenCursor() const {
  return format::TermCursor(files_.terms, format::TermCursor::File::kDictionary,
                            static_cast<uint32_t>(fields_.size()), files_.info.document_count);
}

bool TermWalk::IsWanted(const format::TermCursor& cursor) {
  return !live_filter_.has_value() ||
         live_filter_->IsLive(cursor.info(), fields_[static_cast<size_t>(cursor.field())].omits_frequencies);
}

uint64_t TermWalk::Count() {
  if (!count_.has_value()) {
    uint64_t live = 0;
    for (format::TermCursor cursor = OpenCursor(); cursor.Next();) {
      if (IsWanted(cursor)) ++live;
    }
    count_ = live;
  }
  return *count_;
}

bool TermWalk::Next() {
  at_term_ = false;
  while (cursor_.Next()) {
    if (IsWanted(cursor_)) {
      at_term_ = true;
      break;
    }
  }
  return at_term_;
}

const Lucene::String& TermWalk::WideFieldName(int32_t field) {
  if (field != wide_field_number_) {
    wide_field_number_ = field;
    wide_field_.clear();
    AppendCodePoints(fields_[static_cast<size_t>(field)].name, wide_field_);
  }
  return wide_field_;
}

Lucene::TermPtr TermWalk::Term() {
  if (!at_term_) return {};
  // A term that nobody else holds any more is filled anew: a walk then allocates nothing.
  if (!term_ || !term_.unique()) term_ = Lucene::newLucene<Lucene::Term>(Lucene::String());
  term_->_field = WideFieldName(cursor_.field());
  term_->_text.clear();
  if (!AppendCodePoints(cursor_.text(), term_->_text)) cursor_.Damaged("term is not valid UTF-8");
  return term_;
}

}  // namespace vantrel::elastic
