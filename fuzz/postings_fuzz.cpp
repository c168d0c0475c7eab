#include "elastic/format/segment/postings.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;

namespace {

struct Term {
  std::shared_ptr<const ByteSource> postings;
  TermInfo info;
  bool omits_frequencies = false;
  int32_t document_count = 0;
};

struct Outcome {
  bool failed = false;
  std::vector<uint32_t> frequencies = {};
  int32_t last_document = 0;
  uint64_t end = 0;

  bool operator==(const Outcome&) const = default;
};

Outcome PassOneByOne(const Term& term) {
  PostingsReader postings(term.postings, term.document_count);
  std::vector<uint32_t> frequencies;
  try {
    postings.Seek(term.info, term.omits_frequencies);
    for (int32_t before = -1; postings.Next(); before = postings.document()) {
      Require(postings.document() > before, "documents ascend");
      Require(postings.document() < term.document_count, "documents lie in the segment");
      Require(postings.frequency() > 0, "a document that is listed holds the term");
      frequencies.push_back(postings.frequency());
    }
  } catch (const vantrel::elastic::IndexError&) {
    return {.failed = true};
  }
  Require(static_cast<int32_t>(frequencies.size()) == term.info.document_frequency,
          "as many documents are walked as the term announces");
  return {false, std::move(frequencies), postings.document(), postings.offset()};
}

// Blocks that lie in the buffer are decoded at once.
Outcome PassInBlocks(const Term& term, int32_t block, size_t buffer) {
  PostingsReader postings(term.postings, term.document_count, buffer);
  std::vector<uint32_t> frequencies;
  try {
    postings.Seek(term.info, term.omits_frequencies);
    for (int32_t left = term.info.document_frequency; left > 0; left -= block) {
      postings.PassBlock(std::min(block, left));
      const uint64_t expected = postings.block_occurrences();
      const uint32_t bound = postings.block_bound();
      const uint64_t end = postings.offset();
      uint64_t occurrences = 0;
      for (const uint32_t frequency : postings.BlockFrequencies()) {
        Require(frequency <= bound, "no frequency is above the bound");
        occurrences += frequency;
        frequencies.push_back(frequency);
      }
      Require(occurrences == expected, "the occurrences are those of all documents");
      Require(postings.offset() == end, "reading the block once more leads to the same place");
    }
  } catch (const vantrel::elastic::IndexError&) {
    return {.failed = true};
  }
  return {false, std::move(frequencies), postings.document(), postings.offset()};
}

}  // namespace

// A byte whether frequencies are omitted, two for the number of documents, two for the term's, one for its
// pointer, then the file. However large the blocks, the outcome must be that of one document after the other.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    Term term;
    term.omits_frequencies = input.TakeByte() % 2 != 0;
    term.document_count = static_cast<int32_t>(input.TakeNumber());
    term.info.document_frequency = static_cast<int32_t>(input.TakeNumber());
    term.info.postings_pointer = input.TakeByte();
    term.postings = input.TakeSource();
    const Outcome expected = PassOneByOne(term);
    for (const int32_t block : {1, 3, 15, PostingsReader::kLongestBlock}) {
      for (const size_t buffer : {size_t{64}, ByteReader::kDefaultBufferSize}) {
        Require(PassInBlocks(term, block, buffer) == expected, "blocks are no other reading");
      }
    }
  });
}
