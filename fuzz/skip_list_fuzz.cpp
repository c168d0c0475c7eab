#include "elastic/format/segment/skip_list.h"

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// A byte each for the skip interval, the most levels and whether there are payloads, two for the document frequency,
// then the file.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const int32_t interval = input.TakeByte();
    const int32_t most_levels = input.TakeByte();
    const bool has_payloads = input.TakeByte() % 2 != 0;
    const auto documents = static_cast<int32_t>(input.TakeNumber());
    SkipListReader reader(input.TakeSource(), interval, most_levels);
    reader.Seek(0, documents, has_payloads);
    Require(reader.levels() <= std::max(most_levels, 0), "there are no more levels than allowed");
    for (int level = reader.levels() - 1; level >= 0; --level) {
      while (reader.offset(level) < reader.end(level)) {
        const uint64_t before = reader.offset(level);
        reader.Next(level);
        Require(reader.offset(level) > before, "every entry takes bytes");
      }
    }
  });
}
