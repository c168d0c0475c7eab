#include "elastic/format/commit/file_names.h"
#include "elastic/lookup/opening_check.h"
#include "elastic/lookup/positions_lookup.h"
#include "elastic/lookup/vector_lookup.h"
#include "fuzz_input.h"

using quorelastic::fuzz::FuzzInput;
using quorelastic::testing::MemoryFolder;
using vantrel::elastic::lookup::CheckPositionsLookup;
using vantrel::elastic::lookup::CheckVectorLookup;
using vantrel::elastic::lookup::OpenedSegment;
using vantrel::elastic::lookup::OpeningCheck;
using vantrel::elastic::lookup::WantedTerm;

namespace {

// Asks for a segment's files as the index library does, as far as they are there.
void OpenFiles(OpeningCheck& check, const MemoryFolder& folder) {
  for (const auto& [name, file] : folder.files) {
    if (vantrel::elastic::format::CommitGeneration(name).has_value()) check.Check(name, folder.Open(name));
  }
  for (const char* segment : {"_1", "_0"}) {
    for (const char* extension : {".cfs", ".fnm", ".tis", ".tii", ".frq", ".prx", "_1.del"}) {
      const std::string name = std::string(segment) + extension;
      if (folder.Exists(name)) check.Check(name, folder.Open(name));
    }
    for (const char* name : {"_0.cfx", "_0.tvx", "_0.tvd", "_0.tvf"}) {
      if (folder.Exists(name)) check.Check(name, folder.Open(name));
    }
  }
}

// What the library would not have opened otherwise.
bool IsWhole(const OpenedSegment& segment) {
  for (const char* extension : {".tis", ".tii", ".frq", ".prx"}) {
    if (segment.Core(extension) == nullptr) return false;
  }
  const bool has_vectors = segment.Store(".tvx") != nullptr;
  return !has_vectors || (segment.Store(".tvd") != nullptr && segment.Store(".tvf") != nullptr);
}

}  // namespace

// A term's field and text, each after a byte for its length, and two bytes for a document; then the files of a folder.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzInput input(data, size);
  const std::string field = input.TakeText();
  const WantedTerm term{field, input.TakeText()};
  const auto document = static_cast<int32_t>(input.TakeNumber());
  MemoryFolder folder;
  input.TakeFiles(folder);
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    OpeningCheck check(term);
    OpenFiles(check, folder);
    const std::vector<OpenedSegment> segments = check.TakeSegments();
    for (const OpenedSegment& segment : segments) {
      if (!IsWhole(segment)) return;
    }
    // The first would keep the second from being tried where it throws.
    quorelastic::fuzz::DecodeWithinBounds([&] { CheckPositionsLookup(segments, term, document); });
    CheckVectorLookup(segments, term.field, document);
  });
}
