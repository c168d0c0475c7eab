#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/lookup/opened_segment.h"

namespace vantrel::elastic::lookup {

// Walks the index over a dictionary (.tii) to its end, as the index library does when it loads it, and notes where the
// library begins to look for a term: its search by halves ends at the same entry, sorted or not. Nothing without a
// term, and where the search ends before the first entry. `count` is called at each entry. Throws IndexDamagedError,
// IndexIoError, and what `count` throws.
std::optional<LookupPlace> FindPlace(const std::shared_ptr<const format::ByteSource>& index,
                                     const std::vector<format::FieldInfo>& fields, int32_t document_count,
                                     const std::optional<WantedTerm>& term,
                                     const std::function<void(const format::TermCursor&)>& count);

// Compares the terms of a dictionary or its index, one after the other, with another one, by the order in which the index
// library looks for terms: by the names of the fields, then by code points. Takes time in proportion to what has changed
// of their texts.
class TermComparison {
 public:
  TermComparison(const std::vector<format::FieldInfo>& fields, const WantedTerm& other)
      : fields_(fields), other_(other) {}

  // To be called for each term in turn: below 0 where it comes before the other one, above 0 where it comes behind.
  int Compare(const format::TermCursor& cursor);

 private:
  const std::vector<format::FieldInfo>& fields_;
  const WantedTerm& other_;
  size_t same_ = 0;  // how many leading bytes the last text and the other's have in common
};

}  // namespace vantrel::elastic::lookup
