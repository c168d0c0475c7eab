#include "elastic/check/terms_check.h"

#include <algorithm>

#include "elastic/check/mismatch.h"
#include "elastic/common/quoted.h"
#include "elastic/format/segment/skip_list.h"

namespace vantrel::elastic::check {

TermsCheck::TermsCheck(const TermSources& sources, const std::vector<format::FieldInfo>& fields,
                       int32_t document_count)
    : fields_(fields),
      sources_(sources),
      dictionary_(sources.dictionary, format::TermCursor::File::kDictionary,
                  static_cast<uint32_t>(fields.size()), document_count),
      index_(sources.index, format::TermCursor::File::kIndex, static_cast<uint32_t>(fields.size()),
             document_count),
      field_order_(fields),
      order_(dictionary_.is_utf8()),
      postings_(sources.postings, sources.positions, document_count, dictionary_) {
  CheckHeaders();
}

void TermsCheck::CheckHeaders() const {
  const int32_t levels = dictionary_.most_skip_levels();
  if (levels < 1 || levels > format::kMostSkipLevels || dictionary_.skip_interval() < 2) {
    Refuse(Grade::kUnsafe, dictionary_.name(), 0,
           "skip interval of 2 or more, and 1 to " + std::to_string(format::kMostSkipLevels) + " skip levels",
           "interval " + std::to_string(dictionary_.skip_interval()) + ", " + std::to_string(levels) +
               " levels");
  }
  const auto conflict = FindHeaderConflict(dictionary_, index_);
  if (!conflict.has_value()) return;
  Refuse(Grade::kUnsafe, index_.name(), 0,
         conflict->what + (" " + std::to_string(conflict->in_dictionary)) + ", by the dictionary",
         std::to_string(conflict->in_index));
}

void TermsCheck::Run() {
  const auto interval = static_cast<uint64_t>(dictionary_.index_interval());
  for (number_ = 0;; ++number_) {
    if (number_ % interval == 0 && number_ < dictionary_.count()) CheckIndexEntry();
    if (!dictionary_.Next()) break;
    CheckTerm();
  }
  // Past its last entry the cursor looks whether the file ends there, too.
  if (index_.Next()) {
    Refuse(Grade::kUnsafe, index_.name(), index_.offset(), "the end of the index", "one more entry");
  }
  CheckEnds();
}

void TermsCheck::CheckTerm() {
  const format::FieldInfo& field = fields_[static_cast<size_t>(dictionary_.field())];
  if (!field.indexed || field.name.empty()) {
    Refuse(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(),
           "term of a field that is indexed and has a name",
           "field " + Quoted(field.name) + (field.indexed ? "" : ", which is not indexed"));
  }
  CheckText(field);
  CheckPlace();
  postings_.Check(dictionary_, field);
}

void TermsCheck::CheckText(const format::FieldInfo& field) {
  const format::TermText& text = dictionary_.term_text();
  same_text_ = std::min(same_text_, text.same_length());
  if (!dictionary_.HasKeptText()) {
    Refuse(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(), "text that the index library keeps",
           Quoted(text.text()));
  }
  const format::TermOrders ascends_by =
      dictionary_.field() == dictionary_.field_before()
          ? text.ascends_by()
          : field_order_.OrdersBefore(dictionary_.field_before(), dictionary_.field());
  if (order_.Take(ascends_by)) return;
  Refuse(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(), "term after the one before it",
         Quoted(text.text()) + " of field " + Quoted(field.name));
}

// Each entry of the index stands before a block of terms: it repeats the last term of the block before, at which the
// dictionary's cursor is, and tells where the block begins.
void TermsCheck::CheckIndexEntry() {
  if (!index_.Next()) {
    Refuse(Grade::kUnsafe, index_.name(), index_.offset(), "an entry for term " + std::to_string(number_),
           "the end of the index");
  }
  const std::string& file = index_.name();
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "pointer into the dictionary", dictionary_.end_offset(),
               index_.dictionary_pointer());
  const format::TermInfo& term = dictionary_.info();
  const format::TermInfo& info = index_.info();
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "postings pointer", term.postings_pointer,
               info.postings_pointer);
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "positions pointer", term.positions_pointer,
               info.positions_pointer);
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "document frequency",
               static_cast<uint64_t>(term.document_frequency),
               static_cast<uint64_t>(info.document_frequency));
  if (dictionary_.index_repeats_skips()) {
    RequireEqual(Grade::kUnsafe, file, index_.offset(), "offset of skip data", term.skip_offset,
                 info.skip_offset);
  }
  const std::string_view text = dictionary_.text();
  same_text_ =
      format::SameLength(text, index_.text(), std::min(same_text_, index_.term_text().same_length()));
  const bool same_field = index_.field() == dictionary_.field() || number_ == 0;
  if (same_field && same_text_ == text.size() && same_text_ == index_.text().size()) return;
  Refuse(Grade::kUnsafe, file, index_.offset(),
         Quoted(text) + " of field number " + std::to_string(dictionary_.field()),
         Quoted(index_.text()) + " of field number " + std::to_string(index_.field()));
}

void TermsCheck::CheckPlace() const {
  const format::TermInfo& info = dictionary_.info();
  const bool is_exact = postings_.is_end_exact() || info.postings_pointer < postings_.postings_end();
  if (is_exact) {
    RequireEqual(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(), "term with its postings at",
                 postings_.postings_end(), info.postings_pointer);
  }
  RequireEqual(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(), "term with its positions at",
               postings_.positions_end(), info.positions_pointer);
}

void TermsCheck::CheckEnds() const {
  const uint64_t size = sources_.postings->size();
  if (postings_.is_end_exact() || size < postings_.postings_end()) {
    RequireEqual(Grade::kDamaged, sources_.postings->name(), postings_.postings_end(),
                 "the postings to end at", postings_.postings_end(), size);
  }
  if (sources_.positions == nullptr) return;
  RequireEqual(Grade::kDamaged, sources_.positions->name(), postings_.positions_end(),
               "the positions to end at", postings_.positions_end(), sources_.positions->size());
}

}  // namespace vantrel::elastic::check
