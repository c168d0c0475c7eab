#include "elastic/format/segment/field_infos.h"

#include <exception>
#include <string_view>
#include <unordered_set>

#include "elastic/common/text.h"
#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/name_budget.h"
#include "elastic/format/segment/utf16_text.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

constexpr auto kFormat = static_cast<uint32_t>(kFieldInfosFormat);
constexpr uint64_t kShortestField = 2;  // an empty name, the flags

// The flags.
constexpr uint8_t kIndexed = 0x01;
constexpr uint8_t kVectors = 0x02;
constexpr uint8_t kVectorPositions = 0x04;
constexpr uint8_t kVectorOffsets = 0x08;
constexpr uint8_t kOmitsNorms = 0x10;
constexpr uint8_t kPayloads = 0x20;
constexpr uint8_t kOmitsFrequencies = 0x40;

void SetFlags(FieldInfo& field, uint8_t flags) {
  field.flags = flags;
  field.indexed = (flags & kIndexed) != 0;
  field.omits_frequencies = (flags & kOmitsFrequencies) != 0;
  field.has_vectors = (flags & kVectors) != 0;
  field.has_vector_positions = (flags & kVectorPositions) != 0;
  field.has_vector_offsets = (flags & kVectorOffsets) != 0;
  field.omits_norms = (flags & kOmitsNorms) != 0;
  field.has_payloads = (flags & kPayloads) != 0;
}

enum class Names { kUtf8, kUtf16Units };

std::string ReadName(ByteReader& reader, Names names) {
  if (names == Names::kUtf8) return reader.ReadString();
  std::u16string units;
  ReadUtf16Units(reader, reader.ReadVInt(), units);
  return FromUtf16(units);
}

std::vector<FieldInfo> ReadAll(ByteReader& reader, Names names) {
  uint64_t count_start = reader.offset();
  uint32_t count = reader.ReadVInt();
  if (count == kFormat) {
    count_start = reader.offset();
    count = reader.ReadVInt();
  } else if (static_cast<int32_t>(count) < 0) {
    reader.Damaged(0, "format is " + std::to_string(static_cast<int32_t>(count)) + ", but only " +
                          std::to_string(kFieldInfosFormat) + " is known");
  }
  if (count > reader.remaining() / kShortestField) {
    reader.Damaged(count_start,
                   std::to_string(count) + " fields, but the file ends at " + std::to_string(reader.size()));
  }
  if (count > uint32_t{kMostFields}) {
    reader.Damaged(count_start, std::to_string(count) + " fields are too many");
  }
  std::vector<FieldInfo> fields;
  fields.reserve(count);  // so that the views of the names stay valid
  // No writer makes two fields of one name; a hole in the file would be full of them.
  std::unordered_set<std::string_view> seen;
  NameBudget budget;
  for (; count > 0; --count) {
    const uint64_t start = reader.offset();
    FieldInfo& field = fields.emplace_back();
    field.name = ReadName(reader, names);
    budget.Take(reader, start, field.name);
    if (!seen.insert(field.name).second) {
      reader.Damaged(start, "field " + std::to_string(fields.size() - 1) + " bears the name of one before");
    }
    field.offset = start;
    SetFlags(field, reader.ReadByte());
  }
  if (reader.remaining() != 0) {
    reader.Damaged(reader.offset(),
                   "fields end here, but the file goes on to " + std::to_string(reader.size()));
  }
  return fields;
}

}  // namespace

std::vector<FieldInfo> ReadFieldInfos(const std::shared_ptr<const ByteSource>& source) {
  std::exception_ptr failure;
  try {
    ByteReader reader(source);
    return ReadAll(reader, Names::kUtf8);
  } catch (const IndexDamagedError&) {
    failure = std::current_exception();
  }
  try {
    ByteReader reader(source);
    if (reader.ReadVInt() != kFormat) {
      reader.Seek(0);
      return ReadAll(reader, Names::kUtf16Units);
    }
  } catch (const IndexDamagedError&) {
    // What the first reading found says more.
  }
  std::rethrow_exception(failure);
}

}  // namespace vantrel::elastic::format
