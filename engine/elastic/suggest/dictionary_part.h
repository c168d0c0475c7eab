#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/term_cursor.h"
#include "elastic/suggest/term_order.h"

namespace vantrel::elastic {

// A number that any single difference between what went in makes another one.
class Fingerprint {
 public:
  // An entry of the index over a dictionary: the last term before a place, and where that place is.
  void Add(std::string_view text, int32_t field, const format::TermInfo& info, bool has_skip_offset,
           uint64_t dictionary_pointer);

  bool operator==(const Fingerprint&) const = default;

 private:
  void Mix(uint64_t word);

  uint64_t value_ = 0;
};

// A part of a dictionary that has to be read, by the index over it. Entry k of the index stands before term k times
// the interval: it repeats the term before that one, and tells where that one begins.
struct DictionaryPart {
  // Behind which entry it begins; of the first entry, which stands before all terms, it says nothing.
  format::TermPlace begin;
  std::string begin_text;
  uint64_t begin_number = 0;  // of the term there

  // The number of the term behind its last one: where an entry of the index stands, or the dictionary ends.
  uint64_t end_number = 0;

  // Of the index's entries that stand before terms begin_number (excluded, but for 0) to end_number.
  Fingerprint entries;
};

// The parts to be read for the terms that are looked for. The last one holds them all; it begins one entry earlier
// than would do, so that the last entry before the terms is found again in the dictionary. Those before it are a
// block each, and are only checked: an entry's text is made of pieces of the entries before it, and where a piece
// comes from, the dictionary must agree. Most often that is a handful; beyond 32, some are left out.
//
// Reads the index from its begin to the first entry behind the terms. Throws IndexDamagedError, also where the
// entries do not ascend or the headers of the two files contradict each other, and IndexIoError.
std::vector<DictionaryPart> FindDictionaryParts(const format::TermCursor& dictionary,
                                                format::TermCursor& index, const TermOrder& order);

}  // namespace vantrel::elastic
