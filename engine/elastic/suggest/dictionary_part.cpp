#include "elastic/suggest/dictionary_part.h"

#include <utility>

namespace vantrel::elastic {
namespace {

void CheckHeaders(const format::TermCursor& dictionary, const format::TermCursor& index) {
  const auto conflict = FindHeaderConflict(dictionary, index);
  if (!conflict.has_value()) return;
  index.Damaged(conflict->what + (" is " + std::to_string(conflict->in_index)) +
                ", but by the dictionary it is " + std::to_string(conflict->in_dictionary));
}

// Follows the index up to the terms that are looked for.
class PartFinder {
 public:
  PartFinder(const format::TermCursor& index, uint64_t interval) : index_(index), interval_(interval) {}

  // The entry at the cursor is one before the terms.
  void Pass(uint64_t number) {
    // What was taken from entries of which this one shares less is no longer part of any text.
    while (!parts_.empty() && parts_.back().shared_length >= index_.shared_length()) parts_.pop_back();
    if (parts_.size() == kMostParts) parts_.pop_back();
    if (number > 0) {
      DictionaryPart part;
      part.begin = std::move(last_);
      part.begin_text = std::move(last_text_);
      part.begin_number = (number - 1) * interval_;
      part.end_number = number * interval_;
      if (number == 1) part.entries = first_;
      AddEntry(index_.field(), part.entries);
      parts_.push_back({std::move(part), index_.shared_length()});
    } else {
      AddEntry(-1, first_);
    }
    index_.CopyPlace(last_);
    last_text_ = index_.text();
  }

  // The last part goes on to term `end_number`, past these entries.
  void AddToLast() { AddEntry(index_.field(), Last().entries); }
  void EndAt(uint64_t end_number) { Last().end_number = end_number; }

  std::vector<DictionaryPart> Take() {
    std::vector<DictionaryPart> parts;
    for (SharedPart& part : parts_) parts.push_back(std::move(part.part));
    return parts;
  }

 private:
  static constexpr size_t kMostParts = 32;

  struct SharedPart {
    DictionaryPart part;
    uint32_t shared_length = 0;  // of the entry at its end, with the one at its begin
  };

  void AddEntry(int32_t field, Fingerprint& entries) const {
    entries.Add(index_.text(), field, index_.info(), index_.index_repeats_skips(),
                index_.dictionary_pointer());
  }

  // Where no entry but the first is before the terms, the dictionary is read from its begin.
  DictionaryPart& Last() {
    if (parts_.empty()) parts_.emplace_back().part.entries = first_;
    return parts_.back().part;
  }

  const format::TermCursor& index_;
  uint64_t interval_;
  std::vector<SharedPart> parts_;
  Fingerprint first_;
  format::TermPlace last_;
  std::string last_text_;
};

}  // namespace

// Each step can be undone, so that one different word cannot come to the same end.
void Fingerprint::Mix(uint64_t word) {
  constexpr uint64_t kOdd = 0x9e3779b97f4a7c15;
  value_ = (value_ ^ word) * kOdd;
  value_ ^= value_ >> 32;
}

void Fingerprint::Add(std::string_view text, int32_t field, const format::TermInfo& info,
                      bool has_skip_offset, uint64_t dictionary_pointer) {
  for (const char byte : text) Mix(static_cast<unsigned char>(byte));
  Mix(text.size());
  Mix(static_cast<uint32_t>(field));
  Mix(static_cast<uint32_t>(info.document_frequency));
  Mix(info.postings_pointer);
  Mix(info.positions_pointer);
  if (has_skip_offset) Mix(info.skip_offset);
  Mix(dictionary_pointer);
}

std::vector<DictionaryPart> FindDictionaryParts(const format::TermCursor& dictionary,
                                                format::TermCursor& index, const TermOrder& order) {
  CheckHeaders(dictionary, index);
  const auto interval = static_cast<uint64_t>(dictionary.index_interval());
  AscendingTerms ascending(order);
  PartFinder finder(index, interval);
  uint64_t end_number = dictionary.count();
  for (uint64_t number = 0; index.Next(); ++number) {
    // The first one stands before all terms.
    if (number > 0) ascending.Check(index);
    const TermOrder::Side side = number > 0 ? order.SideOf(index) : TermOrder::Side::kBefore;
    if (side == TermOrder::Side::kBefore) {
      finder.Pass(number);
      continue;
    }
    finder.AddToLast();
    if (side == TermOrder::Side::kBehind) {
      end_number = number * interval;
      break;
    }
  }
  finder.EndAt(end_number);
  return finder.Take();
}

}  // namespace vantrel::elastic
