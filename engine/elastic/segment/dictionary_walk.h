#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/format/segment/term_order.h"

namespace vantrel::elastic::format {

// Which terms of a dictionary are wanted. Texts are bytes of UTF-8, and a prefix may end within a character.
struct TermSelection {
  enum class Kind {
    kPrefix,  // those that begin with the text
    kExact,   // the one that is the text
  };
  Kind kind = Kind::kPrefix;
  std::optional<std::string> field = {};  // without one, all fields; then the kind is kPrefix
  std::string text = {};
};

// A number that any single difference between what went in makes another one.
class Fingerprint {
 public:
  void Mix(uint64_t word);
  uint64_t value() const { return value_; }

  bool operator==(const Fingerprint&) const = default;

 private:
  uint64_t value_ = 0;
};

// The fingerprint of a text that changes from its end. Takes time in proportion to what has changed.
class TextFingerprint {
 public:
  // `same`: how many leading bytes are those of the text that was asked for last.
  uint64_t Of(std::string_view text, size_t same);

 private:
  std::vector<Fingerprint> starts_{1};  // of the text before each of its blocks
};

// Walks the terms of a selection in a dictionary's order (term_order.h). The walk begins near the first of them, by the
// index over the dictionary, and ends near the last: what it takes does not depend on the other terms, but for the index,
// of which every entry up to there is read. This is the one way to seek in a dictionary: it does not trust the index.
//
// It reads whole blocks of the dictionary, a block being what lies between two entries of the index, to the end of the
// one that holds the last term, and begins a block earlier than would do. Every term and every entry that it passes must
// come after the one before it and be well-formed, and each entry that it passes must be found again in the dictionary.
// An entry's text is made of pieces of the entries before it, so the blocks where these pieces come from are read, too:
// most often a handful; beyond 32, or 64 KiB of text, some are left out. So a wrong bit shows, unless
// - what it leaves of the dictionary could have been written so: other texts in order, fewer documents, or
// - it makes an entry of the index, further ahead, share more of its text with the one before it, and that leaves
//   all entries in order, or
// - it moves the postings of all entries behind it alike.
// Without a field, the whole dictionary is walked, and the index is not read.
//
// Time goes with the bytes that are read. Memory is that of a few texts and of what is read of the index for 32 entries.
// For one thread at a time. Everything may throw IndexDamagedError, IndexIoError.
class DictionaryWalk {
 public:
  DictionaryWalk(const std::shared_ptr<const ByteSource>& dictionary,
                 const std::shared_ptr<const ByteSource>& index, const std::vector<FieldInfo>& fields,
                 int32_t document_count, TermSelection selection,
                 size_t buffer_size = TermCursor::kDefaultBufferSize);
  DictionaryWalk(const DictionaryWalk&) = delete;
  DictionaryWalk& operator=(const DictionaryWalk&) = delete;
  ~DictionaryWalk();

  enum class Move {
    kTerm,        // to a term of the selection
    kPassedOver,  // another one
    kEnd,         // there are no more, and all checks are done
  };
  Move Step();

  // Steps to the next term of the selection, at first to the first one; false at the end.
  bool Next() {
    Move move = Move::kPassedOver;
    while (move == Move::kPassedOver) move = Step();
    return move == Move::kTerm;
  }

  // Stands at the term, until the next step.
  const TermCursor& cursor() const { return cursor_; }

  // How many leading bytes the text has in common with that of the term of the selection before, at least; in UTF-8,
  // exactly, in the older layouts, as whole characters.
  size_t same_length() const { return same_length_; }

  // How many bytes the texts that it holds take, about; what of it grows while it walks.
  size_t TextRoom() const;
  size_t GrowingRoom() const { return cursor_.term_text().room(); }

  // The orders by which all terms and entries so far ascend.
  TermOrders orders() const { return order_.consistent(); }

 private:
  struct Part;
  class Finder;
  class Locator;

  void FindParts(TermCursor& index);
  bool BeginNextPart();
  bool Advance();
  void CheckTerm(TermCursor& cursor, bool is_first);
  void AddEntry();

  TermSelection selection_;
  TermCursor cursor_;
  FieldOrder field_order_;
  OrderOfTerms order_;
  std::unique_ptr<Locator> locator_;
  std::vector<Part> parts_;  // to be read, the next one last
  TermPlace last_entry_;     // the last one before the terms, of which the parts' places are completed
  bool is_checked_ = false;  // by the index
  uint64_t number_ = 0;      // of the term that comes next
  uint64_t begin_number_ = 0;
  uint64_t end_number_ = 0;  // the number of the term behind the part that is read
  Fingerprint wanted_;       // of the entries that the index has for it
  Fingerprint found_;        // of those that were found again
  TextFingerprint text_fingerprint_;
  size_t same_since_entry_ = 0;
  size_t same_length_ = 0;
  bool is_at_term_ = false;
};

}  // namespace vantrel::elastic::format
