#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "elastic/lookup/opened_segment.h"

namespace vantrel::elastic::lookup {

enum class VectorLookup {
  kSafe,
  kPastEnd,  // the library would read past the end of the vectors, or other documents'
};

// Checks what the index library is about to read for the term vector of a document's field: the document's list of
// fields and the terms of this one. `document` is 0 or more, and the segments hold any documents. Throws IndexError
// about what the library could crash on, run astray on or take gigabytes for.
VectorLookup CheckVectorLookup(const std::vector<OpenedSegment>& segments, const std::string& field,
                               int32_t document);

}  // namespace vantrel::elastic::lookup
