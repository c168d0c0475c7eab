#include "elastic/health/terms_check.h"

#include "elastic/format/quoted.h"
#include "elastic/format/skip_list.h"
#include "elastic/format/text.h"
#include "elastic/health/mismatch.h"

namespace vantrel::elastic::health {

TermsCheck::TermsCheck(const TermSources& sources, const std::vector<format::FieldInfo>& fields,
                       int32_t document_count)
    : fields_(fields),
      sources_(sources),
      dictionary_(sources.dictionary, format::TermCursor::File::kDictionary,
                  static_cast<uint32_t>(fields.size()), document_count),
      index_(sources.index, format::TermCursor::File::kIndex, static_cast<uint32_t>(fields.size()),
             document_count),
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
  for (number_ = 0; dictionary_.Next(); ++number_) {
    if (number_ % static_cast<uint64_t>(dictionary_.index_interval()) == 0) CheckIndexEntry();
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
           "field " + format::Quoted(field.name) + (field.indexed ? "" : ", which is not indexed"));
  }
  CheckOrder(field);
  CheckPlace();
  postings_.Check(dictionary_, field);

  at_first_ = false;
  field_before_ = dictionary_.field();
  text_before_.assign(dictionary_.text());
  info_before_ = dictionary_.info();
}

void TermsCheck::CheckOrder(const format::FieldInfo& field) const {
  const std::string_view text = dictionary_.text();
  if (!format::IsKeptText(text)) {
    Refuse(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(), "text that the index library keeps",
           format::Quoted(text));
  }
  if (at_first_) return;
  const std::string& field_before = fields_[static_cast<size_t>(field_before_)].name;
  const bool ascends = dictionary_.field() == field_before_ ? text > text_before_ : field.name > field_before;
  if (ascends) return;
  Refuse(Grade::kUnsafe, dictionary_.name(), dictionary_.offset(),
         "term after " + format::Quoted(text_before_) + " of field " + format::Quoted(field_before),
         format::Quoted(text) + " of field " + format::Quoted(field.name));
}

// Each entry of the index stands before a block of terms: it repeats the last term of the block before, and tells
// where the block begins.
void TermsCheck::CheckIndexEntry() {
  if (!index_.Next()) {
    Refuse(Grade::kUnsafe, index_.name(), index_.offset(), "an entry for term " + std::to_string(number_),
           "the end of the index");
  }
  const std::string& file = index_.name();
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "pointer into the dictionary", dictionary_.offset(),
               index_.dictionary_pointer());
  const format::TermInfo& info = index_.info();
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "postings pointer", info_before_.postings_pointer,
               info.postings_pointer);
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "positions pointer", info_before_.positions_pointer,
               info.positions_pointer);
  RequireEqual(Grade::kUnsafe, file, index_.offset(), "document frequency",
               static_cast<uint64_t>(info_before_.document_frequency),
               static_cast<uint64_t>(info.document_frequency));
  if (dictionary_.index_repeats_skips()) {
    RequireEqual(Grade::kUnsafe, file, index_.offset(), "offset of skip data", info_before_.skip_offset,
                 info.skip_offset);
  }
  const bool same_field = index_.field() == field_before_ || at_first_;
  if (same_field && index_.text() == text_before_) return;
  Refuse(Grade::kUnsafe, file, index_.offset(),
         format::Quoted(text_before_) + " of field number " + std::to_string(field_before_),
         format::Quoted(index_.text()) + " of field number " + std::to_string(index_.field()));
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

}  // namespace vantrel::elastic::health
