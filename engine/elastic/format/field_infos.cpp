#include "elastic/format/field_infos.h"

#include <exception>

#include "elastic/format/byte_reader.h"
#include "elastic/format/text.h"
#include "elastic/format/utf16_text.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

constexpr auto kFormat = static_cast<uint32_t>(-2);
constexpr uint8_t kIndexed = 0x01;
constexpr uint8_t kOmitsFrequencies = 0x40;

enum class Names { kUtf8, kUtf16Units };

std::string ReadName(ByteReader& reader, Names names) {
  if (names == Names::kUtf8) return reader.ReadString();
  std::u16string units;
  ReadUtf16Units(reader, reader.ReadVInt(), units);
  return FromUtf16(units);
}

std::vector<FieldInfo> ReadAll(ByteReader& reader, Names names) {
  uint32_t count = reader.ReadVInt();
  if (count == kFormat) {
    count = reader.ReadVInt();
  } else if (static_cast<int32_t>(count) < 0) {
    reader.Damaged(0, "format is " + std::to_string(static_cast<int32_t>(count)) + ", but only -2 is known");
  }
  std::vector<FieldInfo> fields;
  for (; count > 0; --count) {
    FieldInfo& field = fields.emplace_back();
    field.name = ReadName(reader, names);
    const uint8_t flags = reader.ReadByte();
    field.indexed = (flags & kIndexed) != 0;
    field.omits_frequencies = (flags & kOmitsFrequencies) != 0;
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
