#include <algorithm>

#include "elastic/common/text.h"
#include "elastic/suggest/suggest_terms_in.h"
#include "fuzz_input.h"

using quorelastic::fuzz::FuzzInput;
using quorelastic::fuzz::Require;
using quorelastic::testing::MemoryFolder;
using vantrel::elastic::SuggestedTerm;
using vantrel::elastic::SuggestRequest;

namespace {

// The order in which suggestions come; no term comes twice.
bool ComesBefore(const SuggestedTerm& left, const SuggestedTerm& right) {
  if (left.document_frequency != right.document_frequency) {
    return left.document_frequency > right.document_frequency;
  }
  return left.term < right.term;
}

}  // namespace

// A field and a prefix, each after a byte for its length, and a byte for the limit; then the files of a folder.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzInput input(data, size);
  const std::string field = input.TakeText();
  const std::string prefix = input.TakeText();
  const SuggestRequest request{.field = field, .prefix = prefix, .limit = input.TakeByte()};
  MemoryFolder folder;
  input.TakeFiles(folder);
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    const auto suggested = vantrel::elastic::SuggestTermsIn({&folder}, request);
    Require(suggested.size() <= request.limit, "no more terms are suggested than were asked for");
    for (const SuggestedTerm& term : suggested) {
      Require(term.term.starts_with(prefix), "a suggested term begins with the prefix");
      Require(vantrel::elastic::IsValidUtf8(term.term), "a suggested term is valid UTF-8");
      Require(term.document_frequency > 0, "a suggested term is in a document");
    }
    const auto unordered = std::adjacent_find(
        suggested.begin(), suggested.end(),
        [](const SuggestedTerm& left, const SuggestedTerm& right) { return !ComesBefore(left, right); });
    Require(unordered == suggested.end(), "the most frequent terms come first, each once");
  });
}
