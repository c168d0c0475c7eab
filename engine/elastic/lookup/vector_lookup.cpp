#include "elastic/lookup/vector_lookup.h"

#include <limits>

#include "elastic/format/segment/term_vectors.h"

namespace vantrel::elastic::lookup {
namespace {

void RequireLittleMemory(const format::TermVectorsReader& vectors, size_t field) {
  constexpr uint64_t kMost = uint64_t{96} << 20;
  const uint64_t bytes = vectors.LibraryMemory();
  if (bytes <= kMost) return;
  vectors.terms().Damaged(vectors.TermsStart(field), "the index library would take " + std::to_string(bytes) +
                                                         " bytes of memory for this vector");
}

VectorLookup CheckDocument(const OpenedSegment& segment, const format::FieldInfo& field, int64_t document) {
  const OpenedSegment::Source index = segment.Store(".tvx");
  // Where each document that was to have vectors failed to be written, there are no files.
  if (index == nullptr) return VectorLookup::kSafe;
  format::TermVectorsReader vectors(index, segment.Store(".tvd"), segment.Store(".tvf"),
                                    static_cast<uint32_t>(segment.fields.size()));
  const int64_t number = document + (segment.has_own_store() ? 0 : segment.info.store_offset);
  if (document >= segment.info.document_count || number >= static_cast<int64_t>(vectors.documents())) {
    return VectorLookup::kPastEnd;
  }
  // The library computes the place in 32 bits.
  const auto place = vectors.PointerOffset(static_cast<uint64_t>(number));
  if (place > static_cast<uint64_t>(std::numeric_limits<int32_t>::max())) {
    vectors.index().Damaged(place,
                            "term vectors of document " + std::to_string(number) + " lie too far behind");
  }
  vectors.Seek(static_cast<uint64_t>(number));
  for (size_t i = 0; i < vectors.fields().size(); ++i) {
    if (&segment.fields[vectors.fields()[i].number] != &field) continue;
    vectors.SeekTerms(i);
    vectors.PassTerms();
    RequireLittleMemory(vectors, i);
  }
  return VectorLookup::kSafe;
}

}  // namespace

VectorLookup CheckVectorLookup(const std::vector<OpenedSegment>& segments, const std::string& field,
                               int32_t document) {
  // The last segment that does not begin behind the document; the last one of all where there is no such document.
  const OpenedSegment* found = nullptr;
  int64_t start = 0;
  int64_t found_start = 0;
  for (const OpenedSegment& segment : segments) {
    if (start > document) break;
    found = &segment;
    found_start = start;
    start += segment.info.document_count;
  }
  if (found == nullptr) return VectorLookup::kSafe;
  const format::FieldInfo* const info = found->FindField(field);
  if (info == nullptr || !info->has_vectors) return VectorLookup::kSafe;
  return CheckDocument(*found, *info, document - found_start);
}

}  // namespace vantrel::elastic::lookup
