#include "elastic/format/segment/positions.h"

#include "elastic/format/segment/postings.h"
#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

namespace {

struct Outcome {
  bool failed = false;
  uint64_t postings_end = 0;
  uint64_t positions_end = 0;

  bool operator==(const Outcome&) const = default;
};

// Passes all documents in blocks of that many, or one by one. Blocks that lie in the buffer are decoded at once.
Outcome Pass(const std::shared_ptr<const ByteSource>& documents,
             const std::shared_ptr<const ByteSource>& places, const TermInfo& term, bool has_payloads,
             int32_t block, size_t buffer) {
  PostingsReader postings(documents, 1000, buffer);
  PositionsReader positions(places, buffer);
  try {
    postings.Seek(term, false);
    positions.Seek(0, has_payloads);
    for (int32_t left = term.document_frequency; block > 0 && left > 0; left -= block) {
      postings.PassBlock(std::min(block, left));
      positions.PassBlock(postings);
    }
    while (block == 0 && postings.Next()) positions.PassDocument(postings.frequency());
  } catch (const vantrel::elastic::IndexError&) {
    return {.failed = true};
  }
  Require(positions.offset() <= positions.size(), "nothing is read past the end");
  return {false, postings.offset(), positions.offset()};
}

}  // namespace

// A byte whether there are payloads, one for the document frequency, two for the length of the postings, then those
// and the positions. However large the blocks, the outcome must be that of one document after the other.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const bool has_payloads = input.TakeByte() % 2 != 0;
    TermInfo term;
    term.document_frequency = input.TakeByte();
    const uint32_t length = input.TakeNumber();
    const auto postings = input.TakeSource(length);
    const auto positions = input.TakeSource();
    const Outcome expected = Pass(postings, positions, term, has_payloads, 0, 64);
    for (const int32_t block : {1, 3, 15, 128}) {
      for (const size_t buffer : {size_t{64}, ByteReader::kDefaultBufferSize}) {
        Require(Pass(postings, positions, term, has_payloads, block, buffer) == expected,
                "blocks are no other reading");
      }
    }
  });
}
