#include "elastic/format/segment/term_cursor.h"

#include "elastic/common/text.h"
#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;
using vantrel::elastic::kLongestText;

namespace {

void Walk(TermCursor& cursor, uint32_t field_count, int32_t document_count) {
  uint64_t walked = 0;
  uint64_t pointer = 0;
  while (cursor.Next()) {
    ++walked;
    const TermInfo& info = cursor.info();
    Require(cursor.field() >= -1 && cursor.field() < static_cast<int32_t>(field_count), "a field exists");
    Require(info.document_frequency <= document_count, "no term is in more documents than there are");
    Require(info.postings_pointer >= pointer, "postings ascend");
    Require(cursor.text().size() <= size_t{3} * kLongestText, "a text is bounded");
    pointer = info.postings_pointer + static_cast<uint64_t>(info.document_frequency);
  }
  Require(walked == cursor.count(), "as many terms are walked as are announced");
}

}  // namespace

// A byte for the kind of file, one for the number of fields, two for the number of documents, then the file.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    quorelastic::fuzz::FuzzInput input(data, size);
    const auto file = input.TakeByte() % 2 == 0 ? TermCursor::File::kDictionary : TermCursor::File::kIndex;
    const uint32_t field_count = input.TakeByte();
    const auto document_count = static_cast<int32_t>(input.TakeNumber());
    TermCursor cursor(input.TakeSource(), file, field_count, document_count);
    Walk(cursor, field_count, document_count);
  });
}
