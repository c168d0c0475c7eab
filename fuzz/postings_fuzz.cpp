#include "elastic/format/postings.h"

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

// A byte whether frequencies are omitted, two for the number of documents, two for the term's, one for its
// pointer, then the file.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const bool omits_frequencies = input.TakeByte() % 2 != 0;
    const auto document_count = static_cast<int32_t>(input.TakeNumber());
    TermInfo term;
    term.document_frequency = static_cast<int32_t>(input.TakeNumber());
    term.postings_pointer = input.TakeByte();
    PostingsReader postings(input.TakeSource(), document_count);
    postings.Seek(term, omits_frequencies);
    int32_t walked = 0;
    for (int32_t before = -1; postings.Next(); before = postings.document()) {
      ++walked;
      Require(postings.document() > before, "documents ascend");
      Require(postings.document() < document_count, "documents lie in the segment");
      Require(postings.frequency() > 0, "a document that is listed holds the term");
    }
    Require(walked == term.document_frequency, "as many documents are walked as the term announces");
  });
}
