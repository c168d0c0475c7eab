#include "elastic/terms/term_walk.h"

#include <lucene++/LuceneHeaders.h>

#include <algorithm>
#include <exception>
#include <utility>

#include "elastic/format/text.h"

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

void TermWalk::StartNear(const std::string& field, std::string_view text) {
  const bool has_field = std::any_of(fields_.begin(), fields_.end(),
                                     [&](const format::FieldInfo& info) { return info.name == field; });
  if (files_.terms_index == nullptr || !has_field) return;
  const format::TermSelection selection = {
      .kind = format::TermSelection::Kind::kFrom, .field = field, .text = std::string(text)};
  near_ = std::make_unique<format::DictionaryWalk>(files_.terms, files_.terms_index, fields_,
                                                   files_.info.document_count, selection);
}

bool TermWalk::Next() {
  at_term_ = false;
  while (near_ != nullptr ? near_->Next() : cursor_.Next()) {
    if (IsWanted(cursor())) {
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
    format::AppendCodePoints(fields_[static_cast<size_t>(field)].name, wide_field_);
  }
  return wide_field_;
}

Lucene::TermPtr TermWalk::Term() {
  if (!at_term_) return {};
  // A term that nobody else holds any more is filled anew: a walk then allocates nothing.
  if (!term_ || !term_.unique()) term_ = Lucene::newLucene<Lucene::Term>(Lucene::String());
  term_->_field = WideFieldName(cursor().field());
  term_->_text.clear();
  if (!format::AppendCodePoints(cursor().text(), term_->_text)) cursor().Damaged("term is not valid UTF-8");
  return term_;
}

}  // namespace vantrel::elastic
