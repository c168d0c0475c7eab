#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>
#include <vector>

#include "elastic/format/byte_source.h"
#include "elastic/format/field_infos.h"
#include "elastic/reading/opened_segment.h"

namespace vantrel::elastic::reading {

// Walks the index over a dictionary (.tii) to its end, as the index library does when it loads it, and notes where the
// library begins to look for a term: its search by halves ends at the same entry, sorted or not. Nothing without a
// term, and where the search ends before the first entry. Throws IndexDamagedError, IndexIoError.
std::optional<LookupPlace> FindPlace(const std::shared_ptr<const format::ByteSource>& index,
                                     const std::vector<format::FieldInfo>& fields, int32_t document_count,
                                     const std::optional<WantedTerm>& term);

// Compares the term of a dictionary or its index with another one, in the dictionaries' order: by the names of the
// fields, then by text. `field` is a number, or -1 for what stands before all fields.
int CompareTerms(const std::vector<format::FieldInfo>& fields, int32_t field, std::string_view text,
                 const WantedTerm& other);

}  // namespace vantrel::elastic::reading
