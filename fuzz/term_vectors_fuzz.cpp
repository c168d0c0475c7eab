#include "elastic/format/segment/term_vectors.h"

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// A byte for the number of fields, two each for the lengths of the index and of the documents' lists, then those and
// the terms.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const uint32_t field_count = input.TakeByte();
    const uint32_t index_length = input.TakeNumber();
    const uint32_t lists_length = input.TakeNumber();
    const auto index = input.TakeSource(index_length);
    const auto lists = input.TakeSource(lists_length);
    TermVectorsReader reader(index, lists, input.TakeSource(), field_count);
    for (uint64_t document = 0; document < reader.documents(); ++document) {
      reader.Seek(document);
      Require(reader.fields().size() <= field_count, "no field comes twice");
      for (size_t field = 0; field < reader.fields().size(); ++field) {
        Require(reader.fields()[field].number < field_count, "a field exists");
        reader.SeekTerms(field);
        reader.PassTerms();
      }
    }
  });
}
