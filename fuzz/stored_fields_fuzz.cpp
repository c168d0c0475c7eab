#include "elastic/format/segment/stored_fields.h"

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// Two bytes for the length of the index, the lower first, then the index, then the records.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const uint32_t length = input.TakeNumber();
    const auto index = input.TakeSource(length);
    StoredFieldsReader reader(index, input.TakeSource());
    for (uint64_t document = 0; document < reader.documents(); ++document) {
      reader.Seek(document);
      Require(reader.start() < reader.end(), "a record takes a byte at least");
      while (reader.Next()) reader.PassValue();
      Require(reader.records().offset() <= reader.records().size(), "nothing is read past the end");
    }
  });
}
