#include "elastic/terms/merged_terms.h"

#include <algorithm>
#include <utility>

namespace vantrel::elastic {
namespace {

// `length`, or the begin of the character that it would cut in two.
size_t WholeCharacters(std::string_view text, size_t length) {
  while (length > 0 && length < text.size() && (static_cast<unsigned char>(text[length]) & 0xc0) == 0x80) {
    --length;
  }
  return length;
}

}  // namespace

MergedTerms::MergedTerms(std::vector<std::unique_ptr<SelectedTerms>> segments, format::TermOrders order)
    : order_(order), losers_(segments.size()) {
  for (auto& terms : segments) segments_.push_back({.terms = std::move(terms)});
  RankFields();
}

void MergedTerms::RankFields() {
  if (segments_.size() < 2) return;
  std::vector<std::string_view> names;
  for (const Segment& segment : segments_) {
    for (const format::FieldInfo& field : segment.terms->fields()) names.push_back(field.name);
  }
  const auto is_before = [this](std::string_view left, std::string_view right) {
    return (format::OrdersBefore(left, right) & order_) != 0;
  };
  std::sort(names.begin(), names.end(), is_before);
  names.erase(std::unique(names.begin(), names.end()), names.end());
  for (Segment& segment : segments_) {
    for (const format::FieldInfo& field : segment.terms->fields()) {
      const auto place = std::lower_bound(names.begin(), names.end(), field.name, is_before);
      segment.field_ranks.push_back(static_cast<uint32_t>(place - names.begin()));
    }
  }
}

MergedTerms::Move MergedTerms::Step() {
  if (segments_.empty()) return Move::kEnd;
  if (is_complete_) {
    at_term_.clear();
    if (segments_[top_].is_at_end) return Move::kEnd;
    is_complete_ = false;
    Gather();
  }
  Segment& segment = segments_[next_];
  const Move move = segment.terms->Step();
  if (segment.terms->walk().GrowingRoom() > segment.room) CountRoom(segment);
  if (move == Move::kPassedOver) return move;
  segment.is_at_end = move == Move::kEnd;
  if (!segment.is_at_end) TakeTerm(segment);
  if (is_built_) {
    top_ = Replay(next_);
    if (IsSameAsText(segments_[top_])) {
      Gather();
      return Move::kPassedOver;
    }
    is_complete_ = true;
    return Move::kTerm;
  }
  // At first, each segment is read up to its first term.
  if (++next_ == segments_.size()) {
    top_ = Build(1);
    is_built_ = is_complete_ = true;
  }
  return Move::kPassedOver;
}

void MergedTerms::CountRoom(Segment& segment) {
  const size_t room = segment.terms->walk().GrowingRoom();
  room_ += room - segment.room;
  segment.room = room;
  if (room_ > kMostTextRoom) segment.terms->walk().cursor().Damaged("terms are too long to be merged");
}

// The segment has come from the term that won last to its next one.
void MergedTerms::TakeTerm(Segment& segment) {
  if (segments_.size() == 1) {
    segment.same = 1 + segment.terms->walk().same_length();
    return;
  }
  if ((segment.terms->walk().orders() & order_) == 0) throw SortedOtherwise();
  const auto field = static_cast<size_t>(segment.terms->walk().cursor().field());
  const uint32_t rank = segment.field_ranks[field];
  const bool has_same_field = is_built_ && rank == segment.rank;
  segment.rank = rank;
  segment.same =
      has_same_field ? 1 + WholeCharacters(segment.text(), segment.terms->walk().same_length()) : 0;
}

bool MergedTerms::IsSameAsText(const Segment& segment) const {
  return !segment.is_at_end && segments_.size() > 1 && segment.same == 1 + text_.size() &&
         segment.text().size() == text_.size();
}

// The winner is at the term; then it is to be read on.
void MergedTerms::Gather() {
  const Segment& segment = segments_[top_];
  if (at_term_.empty()) {
    same_length_ = segment.same > 0 ? segment.same - 1 : 0;
    text_.resize(same_length_);
    text_.append(segment.text().substr(same_length_));
  }
  const format::TermCursor& cursor = segment.terms->walk().cursor();
  at_term_.push_back({segment.terms.get(), cursor.field(), cursor.info()});
  next_ = top_;
}

size_t MergedTerms::Build(size_t node) {
  if (node >= segments_.size()) return node - segments_.size();
  const size_t left = Build(2 * node);
  const size_t right = Build(2 * node + 1);
  const size_t winner = Play(left, right);
  losers_[node] = winner == left ? right : left;
  return winner;
}

// Whatever lost on the way of the last winner lost to it: its `same` is about that term, as is the winner's now.
size_t MergedTerms::Replay(size_t winner) {
  for (size_t node = (segments_.size() + winner) / 2; node > 0; node /= 2) {
    if (Play(winner, losers_[node]) != winner) std::swap(winner, losers_[node]);
  }
  return winner;
}

// Which one comes first, of two whose `same` is about one term before both: who shares more with it comes first, and
// shares with the other one what the other one shares with it.
size_t MergedTerms::Play(size_t left, size_t right) {
  Segment& a = segments_[left];
  Segment& b = segments_[right];
  if (a.is_at_end || b.is_at_end) return a.is_at_end ? right : left;
  if (a.same != b.same) return a.same > b.same ? left : right;
  if (a.same == 0 && a.rank != b.rank) return a.rank < b.rank ? left : right;
  const size_t same = format::SameLength(a.text(), b.text(), a.same > 0 ? a.same - 1 : 0);
  const bool right_is_first = (format::OrdersBefore(b.text(), a.text(), same) & order_) != 0;
  Segment& loser = right_is_first ? a : b;
  const std::string_view longer = a.text().size() > same ? a.text() : b.text();
  loser.same = 1 + WholeCharacters(longer, same);
  return right_is_first ? right : left;
}

const std::string& MergedTerms::field() const {
  const Occurrence& first = at_term_.front();
  return first.terms->fields()[static_cast<size_t>(first.field)].name;
}

uint64_t MergedTerms::document_frequency() const {
  uint64_t sum = 0;
  for (const Occurrence& occurrence : at_term_) {
    sum += static_cast<uint64_t>(occurrence.info.document_frequency);
  }
  return sum;
}

bool MergedTerms::IsLive() const {
  const auto at_first_sight = [](const Occurrence& occurrence) {
    return occurrence.terms->IsLiveAtFirstSight(occurrence.info);
  };
  // Of so many segments, each may hold its pages.
  constexpr size_t kFewSegments = 32;
  const auto is_live = [this](const Occurrence& occurrence) {
    const bool is = occurrence.terms->IsLive(occurrence.info, occurrence.field);
    if (segments_.size() > kFewSegments) occurrence.terms->ReleasePages();
    return is;
  };
  return std::any_of(at_term_.begin(), at_term_.end(), at_first_sight) ||
         std::any_of(at_term_.begin(), at_term_.end(), is_live);
}

}  // namespace vantrel::elastic
