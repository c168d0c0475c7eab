#include "elastic/segment/dictionary_walk.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace vantrel::elastic::format {
namespace {

void CheckHeaders(const TermCursor& dictionary, const TermCursor& index) {
  const auto conflict = FindHeaderConflict(dictionary, index);
  if (!conflict.has_value()) return;
  index.Damaged(conflict->what + (" is " + std::to_string(conflict->in_index)) +
                ", but by the dictionary it is " + std::to_string(conflict->in_dictionary));
}

// An entry of the index over a dictionary: the last term before a place, and where that place is.
void MixEntry(uint64_t text, int32_t field, const TermInfo& info, bool has_skip_offset,
              uint64_t dictionary_pointer, Fingerprint& entries) {
  entries.Mix(text);
  entries.Mix(static_cast<uint32_t>(field));
  entries.Mix(static_cast<uint32_t>(info.document_frequency));
  entries.Mix(info.postings_pointer);
  entries.Mix(info.positions_pointer);
  if (has_skip_offset) entries.Mix(info.skip_offset);
  entries.Mix(dictionary_pointer);
}

}  // namespace

// Each step can be undone, so that one different word cannot come to the same end.
void Fingerprint::Mix(uint64_t word) {
  constexpr uint64_t kOdd = 0x9e3779b97f4a7c15;
  value_ = (value_ ^ word) * kOdd;
  value_ ^= value_ >> 32;
}

uint64_t TextFingerprint::Of(std::string_view text, size_t same) {
  constexpr size_t kBlock = 64;
  const auto mix = [](std::string_view bytes, Fingerprint& fingerprint) {
    for (; !bytes.empty(); bytes.remove_prefix(std::min<size_t>(bytes.size(), 8))) {
      uint64_t word = 0;
      std::memcpy(&word, bytes.data(), std::min<size_t>(bytes.size(), 8));
      fingerprint.Mix(word);
    }
  };
  starts_.resize(std::min(same / kBlock + 1, starts_.size()));
  size_t at = (starts_.size() - 1) * kBlock;
  Fingerprint fingerprint = starts_.back();
  for (; at + kBlock <= text.size(); at += kBlock) {
    mix(text.substr(at, kBlock), fingerprint);
    starts_.push_back(fingerprint);
  }
  mix(text.substr(at), fingerprint);
  fingerprint.Mix(text.size());
  return fingerprint.value();
}

// A part of the dictionary that has to be read. Entry k of the index stands before term k times the interval: it repeats
// the term before that one, and tells where that one begins.
struct DictionaryWalk::Part {
  // Behind which entry it begins, without the beginning of its text, of `shared_length`, which is that of all entries
  // behind; of the first entry, which stands before all terms, it says nothing.
  TermPlace begin = {};
  uint32_t shared_length = 0;
  uint64_t begin_number = 0;  // of the term there
  // The number of the term behind its last one: where an entry of the index stands, or the dictionary ends.
  uint64_t end_number = 0;
  // Of the index's entries that stand before terms begin_number (excluded, but for 0) to end_number.
  Fingerprint entries = {};
};

// Where the terms of a cursor stand with regard to a selection. Takes time in proportion to what has changed of their
// texts.
class DictionaryWalk::Locator {
 public:
  enum class Side {
    kBefore,
    kPossible,  // none of the selection, but there may be some before and behind: the order of the older layouts is
                // not known beforehand
    kMatch,
    kBehind,
  };

  Locator(const std::vector<FieldInfo>& fields, const FieldOrder& order, const TermSelection& selection,
          bool is_utf8)
      : order_(order), selection_(selection), is_utf8_(is_utf8) {
    if (!selection_.field.has_value()) return;
    for (size_t i = 0; i < fields.size(); ++i) {
      if (fields[i].name == *selection_.field) field_ = static_cast<int32_t>(i);
    }
  }

  bool has_terms() const { return !selection_.field.has_value() || field_ >= 0; }

  // Forgets what the last text was.
  void Restart() { same_ = 0; }

  // To be called for each term in turn.
  Side SideOf(const TermCursor& cursor) {
    const std::string_view text = cursor.text();
    same_ = SameLength(text, selection_.text, std::min(same_, cursor.term_text().same_length()));
    if (!selection_.field.has_value()) return BeginsWithIt() ? Side::kMatch : Side::kPossible;
    if (cursor.field() != field_) {
      return SideBy(order_.OrdersBefore(cursor.field(), field_), order_.OrdersBefore(field_, cursor.field()));
    }
    if (BeginsWithIt()) {
      return selection_.kind == TermSelection::Kind::kExact && text.size() > same_ ? Side::kBehind
                                                                                   : Side::kMatch;
    }
    if (same_ < text.size() && !is_utf8_ && MayBeALoneSurrogate(text)) return SideBy(0, 0);
    return SideBy(OrdersBefore(text, selection_.text, same_), OrdersBefore(selection_.text, text, same_));
  }

 private:
  bool BeginsWithIt() const { return same_ == selection_.text.size(); }

  Side SideBy(TermOrders before, TermOrders behind) const {
    const TermOrders all = is_utf8_ ? kByCodePoints : kByBoth;
    if ((before & all) == all) return Side::kBefore;
    return (behind & all) == all ? Side::kBehind : Side::kPossible;
  }

  // Both texts go on with characters behind the surrogates, or the term has a lone surrogate there, which reads as
  // U+FFFD but is sorted as what it is.
  bool MayBeALoneSurrogate(std::string_view text) const {
    size_t start = same_;
    while (start > 0 && (static_cast<unsigned char>(text[start]) & 0xc0) == 0x80) --start;
    return text.substr(start).starts_with("\xef\xbf\xbd") && start < selection_.text.size() &&
           static_cast<unsigned char>(selection_.text[start]) >= 0xee;
  }

  const FieldOrder& order_;
  const TermSelection& selection_;
  bool is_utf8_;
  int32_t field_ = -1;
  size_t same_ = 0;  // of the last text and the selection's
};

// Follows the index up to the terms that are wanted, and collects the parts to be read. The last one holds all of these
// terms; it begins one entry earlier than would do, so that the last entry before the terms is found again in the
// dictionary. Those before it are a block each, and are only checked.
class DictionaryWalk::Finder {
 public:
  Finder(const TermCursor& index, uint64_t interval) : index_(index), interval_(interval) {}

  // The entry at the cursor is one before the terms.
  void Pass(uint64_t number) {
    const uint32_t shared = index_.term_text().shared_length();
    // What was taken from entries of which this one shares less is no longer part of any text.
    while (!parts_.empty() && parts_.back().shared_length >= shared) DropLast();
    if (parts_.size() == kMostParts || text_size_ > kMostText) DropLast();
    if (number > 0) {
      Part part;
      part.begin = {.field = last_.field,
                    .text = last_.text.From(shared),
                    .info = last_.info,
                    .dictionary_pointer = last_.dictionary_pointer};
      part.shared_length = shared;
      part.begin_number = (number - 1) * interval_;
      part.end_number = number * interval_;
      if (number == 1) part.entries = first_;
      AddEntry(index_.field(), part.entries);
      text_size_ += part.begin.text.size();
      parts_.push_back(std::move(part));
    } else {
      AddEntry(-1, first_);  // whatever it says
    }
    index_.UpdateCopy(last_);
  }

  // The last part goes on to term `end_number`, past these entries.
  void AddToLast() { AddEntry(index_.field(), Last().entries); }
  void EndAt(uint64_t end_number) { Last().end_number = end_number; }

  std::vector<Part> TakeParts() { return std::move(parts_); }
  TermPlace TakeLastEntry() { return std::move(last_); }

 private:
  static constexpr size_t kMostParts = 32;
  static constexpr size_t kMostText = size_t{64} << 10;

  void DropLast() {
    text_size_ -= parts_.back().begin.text.size();
    parts_.pop_back();
  }

  void AddEntry(int32_t field, Fingerprint& entries) {
    const uint64_t text = text_fingerprint_.Of(index_.text(), index_.term_text().same_length());
    MixEntry(text, field, index_.info(), index_.index_repeats_skips(), index_.dictionary_pointer(), entries);
  }

  // Where no entry but the first is before the terms, the dictionary is read from its begin.
  Part& Last() {
    if (parts_.empty()) parts_.emplace_back().entries = first_;
    return parts_.back();
  }

  const TermCursor& index_;
  uint64_t interval_;
  std::vector<Part> parts_;
  size_t text_size_ = 0;  // of the parts, in bytes
  Fingerprint first_;
  TextFingerprint text_fingerprint_;
  TermPlace last_;
};

DictionaryWalk::~DictionaryWalk() = default;

size_t DictionaryWalk::TextRoom() const {
  size_t room = cursor_.term_text().room() + last_entry_.text.size();
  for (const Part& part : parts_) room += part.begin.text.size();
  return room;
}

DictionaryWalk::DictionaryWalk(const std::shared_ptr<const ByteSource>& dictionary,
                               const std::shared_ptr<const ByteSource>& index,
                               const std::vector<FieldInfo>& fields, int32_t document_count,
                               TermSelection selection, size_t buffer_size)
    : selection_(std::move(selection)),
      cursor_(dictionary, TermCursor::File::kDictionary, static_cast<uint32_t>(fields.size()), document_count,
              buffer_size),
      field_order_(fields),
      order_(cursor_.is_utf8()),
      locator_(std::make_unique<Locator>(fields, field_order_, selection_, cursor_.is_utf8())) {
  if (!locator_->has_terms()) return;
  if (!selection_.field.has_value()) {
    end_number_ = cursor_.count();
    return;
  }
  TermCursor index_cursor(index, TermCursor::File::kIndex, static_cast<uint32_t>(fields.size()),
                          document_count);
  CheckHeaders(cursor_, index_cursor);
  FindParts(index_cursor);
  BeginNextPart();
}

void DictionaryWalk::FindParts(TermCursor& index) {
  using Side = Locator::Side;
  const auto interval = static_cast<uint64_t>(cursor_.index_interval());
  Finder finder(index, interval);
  uint64_t end_number = cursor_.count();
  bool is_before = true;
  for (uint64_t number = 0; index.Next(); ++number) {
    // The first one stands before all terms.
    if (number > 0) CheckTerm(index, number == 1);
    const Side side = number > 0 ? locator_->SideOf(index) : Side::kBefore;
    is_before = is_before && side == Side::kBefore;
    if (is_before) {
      finder.Pass(number);
      continue;
    }
    finder.AddToLast();
    if (side == Side::kBehind) {
      end_number = number * interval;
      break;
    }
  }
  finder.EndAt(end_number);
  parts_ = finder.TakeParts();
  std::reverse(parts_.begin(), parts_.end());
  last_entry_ = finder.TakeLastEntry();
  is_checked_ = true;
}

bool DictionaryWalk::BeginNextPart() {
  if (parts_.empty()) return false;
  Part part = std::move(parts_.back());
  parts_.pop_back();
  number_ = begin_number_ = part.begin_number;
  end_number_ = part.end_number;
  wanted_ = part.entries;
  found_ = {};
  if (number_ > 0) {
    part.begin.text.Prepend(last_entry_.text, part.shared_length);
    cursor_.Resume(part.begin, number_);
    same_since_entry_ = same_length_ = 0;
    locator_->Restart();
  }
  return true;
}

DictionaryWalk::Move DictionaryWalk::Step() {
  if (is_at_term_) same_length_ = cursor_.text().size();
  while (!Advance()) {
    if (!BeginNextPart()) {
      is_at_term_ = false;
      return Move::kEnd;
    }
  }
  const bool is_match = locator_->SideOf(cursor_) == Locator::Side::kMatch;
  is_at_term_ = is_match && parts_.empty();
  return is_at_term_ ? Move::kTerm : Move::kPassedOver;
}

// To the next term of the part, and behind its last one to the place that the index tells.
bool DictionaryWalk::Advance() {
  if (number_ > end_number_) return false;
  const auto interval = static_cast<uint64_t>(cursor_.index_interval());
  const bool is_at_entry =
      number_ % interval == 0 && number_ < cursor_.count() && (number_ != begin_number_ || number_ == 0);
  if (is_checked_ && is_at_entry) AddEntry();
  if (number_ == end_number_) {
    if (is_checked_ && found_ != wanted_) {
      cursor_.DamagedBehind("terms up to here are not those that the index over the dictionary repeats");
    }
    // Past its last term the cursor looks whether the file ends there, too.
    if (number_ == cursor_.count()) cursor_.Next();
    ++number_;
    return false;
  }
  cursor_.Next();
  CheckTerm(cursor_, number_ == 0);
  same_since_entry_ = std::min(same_since_entry_, cursor_.term_text().same_length());
  same_length_ = std::min(same_length_, cursor_.term_text().same_length());
  ++number_;
  return true;
}

void DictionaryWalk::AddEntry() {
  const uint64_t text = text_fingerprint_.Of(cursor_.text(), same_since_entry_);
  same_since_entry_ = cursor_.text().size();
  MixEntry(text, cursor_.field(), cursor_.info(), cursor_.index_repeats_skips(), cursor_.end_offset(),
           found_);
}

void DictionaryWalk::CheckTerm(TermCursor& cursor, bool is_first) {
  const TermOrders ascends_by = cursor.field() == cursor.field_before()
                                    ? cursor.term_text().ascends_by()
                                    : field_order_.OrdersBefore(cursor.field_before(), cursor.field());
  if (!is_first && !order_.Take(ascends_by)) cursor.Damaged("term does not come after the one before it");
  if (!cursor.HasValidText()) cursor.Damaged("term is not valid UTF-8");
}

}  // namespace vantrel::elastic::format
