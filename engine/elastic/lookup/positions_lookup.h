#pragma once

#include <cstdint>
#include <vector>

#include "elastic/lookup/opened_segment.h"

namespace vantrel::elastic::lookup {

// Checks what the index library is about to read to answer where a term stands in the first live document numbered
// `document` or higher: in one segment after the other until one has it, the dictionary from the place that was noted
// when it was opened up to the term, the skip data on the way to the document, the postings behind, and the positions
// of that document. `document` is 0 or more.
//
// Throws IndexError about what the library could crash on or run astray on. Where a file just ends too early, it says
// so itself.
void CheckPositionsLookup(const std::vector<OpenedSegment>& segments, const WantedTerm& term,
                          int32_t document);

}  // namespace vantrel::elastic::lookup
