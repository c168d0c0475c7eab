#include "commands/merged_terms.h"

#include <lucene++/LuceneHeaders.h>

#include <algorithm>
#include <utility>

#include "vantrel/elastic/class_init.h"

namespace quorelasticd {
namespace {

// The order of a heap with the smallest term on top.
constexpr auto kLater = [](const auto& left, const auto& right) {
  return left.term->compareTo(right.term) > 0;
};

}  // namespace

MergedTerms::MergedTerms(const std::string& path, bool live_only, TermSelection selection)
    : selection_(std::move(selection)), info_(vantrel::newClassInit<vantrel::elastic::IndexInfo>(path)) {
  for (int i = 0; i < info_->GetSegmentNum(); ++i) {
    Segment segment{info_->GetTermDict(i, live_only), {}};
    if (selection_.field.has_value()) segment.terms->StartNear(*selection_.field, selection_.prefix);
    Advance(segment);
    if (segment.term) segments_.push_back(std::move(segment));
  }
  std::make_heap(segments_.begin(), segments_.end(), kLater);
}

MergedTerms::Move MergedTerms::Next() {
  if (segments_.empty()) return Move::kEnd;
  std::pop_heap(segments_.begin(), segments_.end(), kLater);
  Segment& segment = segments_.back();
  const Lucene::TermPtr term = segment.term;
  Advance(segment);
  if (segment.term) {
    std::push_heap(segments_.begin(), segments_.end(), kLater);
  } else {
    segments_.pop_back();
  }
  if (last_ && last_->compareTo(term) == 0) return Move::kPassedOver;
  last_ = term;
  field_ = Lucene::StringUtils::toUTF8(term->field());
  text_ = Lucene::StringUtils::toUTF8(term->text());
  if (selection_.field.has_value() && field_ != *selection_.field) {
    return IsPastSelection() ? Move::kEnd : Move::kPassedOver;
  }
  if (text_.starts_with(selection_.prefix)) return Move::kTerm;
  return IsPastSelection() ? Move::kEnd : Move::kPassedOver;
}

void MergedTerms::Advance(Segment& segment) {
  segment.term = segment.terms->Next() ? segment.terms->Term() : Lucene::TermPtr();
}

// UTF-8 sorts by its bytes as by its code points, which is the dictionary's order.
bool MergedTerms::IsPastSelection() const {
  if (!selection_.field.has_value()) return false;
  if (field_ != *selection_.field) return field_ > *selection_.field;
  return text_ > selection_.prefix;  // and does not begin with it
}

}  // namespace quorelasticd
