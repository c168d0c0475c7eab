#include "elastic/terms/merged_terms.h"

#include <memory>
#include <vector>

#include "elastic/segment/segment_files.h"
#include "fuzz_input.h"

using quorelastic::fuzz::FuzzInput;
using quorelastic::fuzz::Require;
using quorelastic::testing::MemoryFolder;
using vantrel::elastic::MergedTerms;
using vantrel::elastic::SelectedTerms;
namespace format = vantrel::elastic::format;

// A field and a prefix, each after a byte for its length, whose terms are listed by the index over the dictionary, and a
// byte that says whether it is asked if they are live; then the files of a folder.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzInput input(data, size);
  const std::string field = input.TakeText();
  const std::string prefix = input.TakeText();
  const bool is_live_wanted = input.TakeByte() % 2 != 0;
  MemoryFolder folder;
  input.TakeFiles(folder);
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    std::vector<std::unique_ptr<SelectedTerms>> segments;
    AddSelectedTerms(format::OpenNewestSegments(folder, format::Need::kAll), {.field = field, .text = prefix},
                     segments);
    try {
      MergedTerms terms(std::move(segments));
      for (std::string before; terms.Next(); before = terms.text()) {
        Require(terms.field() == field, "a term is of the field");
        Require(terms.text().starts_with(prefix), "a term begins with the prefix");
        Require(before.empty() || before < terms.text(), "terms ascend");
        if (is_live_wanted) static_cast<void>(terms.IsLive());
      }
    } catch (const vantrel::elastic::SortedOtherwise&) {
    }
  });
}
