#include "elastic/format/segment/compound_file.h"

#include <vector>

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// The file as it is; its sub-files are those of segment _0.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    const CompoundFile file(quorelastic::fuzz::FuzzInput(data, size).TakeSource());
    for (const char* name :
         {"", "_0.fnm", "_0.tis", "_0.tii", "_0.frq", "_0.prx", "_0.fdx", "_0.fdt", "_0.nrm"}) {
      if (!file.Exists(name)) continue;
      const auto part = file.Open(name);
      Require(part->size() < size, "a sub-file is shorter than the file");
      std::vector<uint8_t> bytes(part->size());
      part->ReadAt(0, bytes);
    }
  });
}
