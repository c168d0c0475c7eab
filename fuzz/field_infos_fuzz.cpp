#include "elastic/format/segment/field_infos.h"

#include "elastic/common/text.h"
#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;
using vantrel::elastic::IsValidUtf8;

// The file as it is.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    const auto fields = ReadFieldInfos(quorelastic::fuzz::FuzzInput(data, size).TakeSource());
    Require(fields.size() <= size / 2, "a field takes two bytes at least");
    for (const FieldInfo& field : fields) Require(IsValidUtf8(field.name), "a field's name is UTF-8");
  });
}
