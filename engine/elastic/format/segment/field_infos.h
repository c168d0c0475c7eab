#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"

namespace vantrel::elastic::format {

struct FieldInfo {
  std::string name;  // UTF-8, may be empty
  bool indexed = false;
  bool omits_frequencies = false;  // postings hold neither frequencies nor positions
  bool has_vectors = false;
  bool has_vector_positions = false;
  bool has_vector_offsets = false;
  bool omits_norms = false;
  bool has_payloads = false;
  uint64_t offset = 0;  // where in the file the field stands
  uint8_t flags = 0;    // as they stand there
};

inline constexpr int32_t kFieldInfosFormat = -2;

// More than any index has.
inline constexpr int32_t kMostFields = int32_t{1} << 16;

// The fields of a segment (.fnm), by their number. Layout:
//
//   VInt -2, VInt count   or, the older layout: VInt count
//   for each field: String name, Byte flags (1 indexed, 2 term vectors, 4 with positions, 8 with offsets,
//   0x10 norms omitted, 0x20 payloads, 0x40 frequencies and positions omitted)
//
// The older layout may hold its names as UTF-16 code units (see text.h); what does not read as UTF-8 to the
// last byte is read that way.
//
// At most kMostFields fields, with names within the bounds of name_budget.h: more is damage. So what is taken is bounded,
// whatever the file. Throws IndexDamagedError, IndexIoError.
std::vector<FieldInfo> ReadFieldInfos(const std::shared_ptr<const ByteSource>& source);

}  // namespace vantrel::elastic::format
