#include "elastic/format/segment/deletions.h"

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// Two bytes for the number of documents, the lower first, then the file.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const auto documents = static_cast<int32_t>(input.TakeNumber());
    Deletions deletions(input.TakeSource(), documents);
    Require(deletions.count() >= 0 && deletions.count() <= documents, "no more are deleted than there are");
    int32_t seen = 0;
    for (int32_t document = 0; document < documents; ++document) {
      if (deletions.Contains(document)) ++seen;
    }
    Require(seen <= deletions.count(), "no more are seen than are counted");
  });
}
