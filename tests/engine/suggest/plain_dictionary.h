#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace quorelastic::testing {

// What a dictionary's file, or the index's over it, holds by a plain reading of its bytes, which takes the layout of
// today alone. It shares nothing with the engine's decoder.
struct PlainDictionary {
  struct Term {
    std::string text;
    int64_t field = -1;
    uint64_t documents = 0;
    uint64_t postings = 0;
    uint64_t positions = 0;
    uint64_t skip_offset = 0;
    uint64_t pointer = 0;  // of an index's entry: into the dictionary
    uint64_t start = 0;    // where it stands in the file

    bool IsSamePlaceAs(const Term& other) const {
      return text == other.text && field == other.field && documents == other.documents &&
             postings == other.postings && positions == other.positions && skip_offset == other.skip_offset;
    }
  };
  uint32_t interval = 0;
  uint32_t skip_interval = 0;
  uint32_t skip_levels = 0;
  std::vector<Term> terms;
};

class PlainDictionaryReader {
 public:
  PlainDictionaryReader(std::string_view bytes, bool is_index) : bytes_(bytes), is_index_(is_index) {}

  // Nothing where the bytes do not fit the layout.
  std::optional<PlainDictionary> Read() {
    PlainDictionary dictionary;
    if (Fixed(4) != 0xfffffffc) return std::nullopt;
    const uint64_t count = Fixed(8);
    dictionary.interval = static_cast<uint32_t>(Fixed(4));
    dictionary.skip_interval = static_cast<uint32_t>(Fixed(4));
    dictionary.skip_levels = static_cast<uint32_t>(Fixed(4));
    PlainDictionary::Term term;
    while (is_good_ && dictionary.terms.size() < count) {
      ReadTerm(term, dictionary.skip_interval);
      dictionary.terms.push_back(term);
    }
    if (!is_good_ || next_ != bytes_.size()) return std::nullopt;
    return dictionary;
  }

 private:
  void ReadTerm(PlainDictionary::Term& term, uint64_t skip_interval) {
    term.start = next_;
    const uint64_t shared = Variable();
    const uint64_t length = Variable();
    if (shared > term.text.size() || length > bytes_.size() - next_) is_good_ = false;
    if (!is_good_) return;
    term.text = term.text.substr(0, shared) + std::string(bytes_.substr(next_, length));
    next_ += length;
    term.field = static_cast<int32_t>(Variable());
    term.documents = Variable();
    term.postings += Variable();
    term.positions += Variable();
    term.skip_offset = term.documents >= skip_interval ? Variable() : 0;
    if (is_index_) term.pointer += Variable();
  }

  uint64_t Byte() {
    if (next_ == bytes_.size()) {
      is_good_ = false;
      return 0;
    }
    return static_cast<unsigned char>(bytes_[next_++]);
  }
  uint64_t Fixed(int length) {
    uint64_t value = 0;
    for (int i = 0; i < length; ++i) value = value << 8 | Byte();
    return value;
  }
  uint64_t Variable() {
    uint64_t value = 0;
    for (int shift = 0; shift < 63; shift += 7) {
      const uint64_t byte = Byte();
      value |= (byte & 0x7f) << shift;
      if (byte < 0x80) return value;
    }
    is_good_ = false;
    return 0;
  }

  std::string_view bytes_;
  bool is_index_;
  size_t next_ = 0;
  bool is_good_ = true;
};

// Whether a dictionary's terms could have been written so: they ascend, by the names of their fields and by text, no
// postings overlap, and no term is in more documents than there are.
inline bool IsWellFormed(const PlainDictionary& dictionary, const std::vector<std::string>& fields,
                         uint64_t documents) {
  const PlainDictionary::Term* before = nullptr;
  for (const auto& term : dictionary.terms) {
    if (term.field < 0 || static_cast<size_t>(term.field) >= fields.size()) return false;
    if (term.documents < 1 || term.documents > documents) return false;
    if (before != nullptr) {
      const std::string& name = fields[static_cast<size_t>(term.field)];
      const std::string& name_before = fields[static_cast<size_t>(before->field)];
      if (name < name_before || (name == name_before && term.text <= before->text)) return false;
      if (term.postings - before->postings < before->documents) return false;
    }
    before = &term;
  }
  return true;
}

// Whether an index tells of a dictionary what is there.
inline bool IsIndexOf(const PlainDictionary& index, const PlainDictionary& dictionary) {
  if (index.interval != dictionary.interval || index.skip_interval != dictionary.skip_interval ||
      index.skip_levels != dictionary.skip_levels || dictionary.interval == 0) {
    return false;
  }
  const uint64_t terms = dictionary.terms.size();
  if (index.terms.size() != (terms + dictionary.interval - 1) / dictionary.interval) return false;
  for (size_t i = 0; i < index.terms.size(); ++i) {
    const size_t number = i * dictionary.interval;
    const auto before = number > 0 ? dictionary.terms[number - 1] : PlainDictionary::Term();
    if (!index.terms[i].IsSamePlaceAs(before)) return false;
    if (index.terms[i].pointer != dictionary.terms[number].start) return false;
  }
  return true;
}

}  // namespace quorelastic::testing
