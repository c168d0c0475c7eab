#include "elastic/check/vectors_check.h"

#include <string>

#include "elastic/check/mismatch.h"
#include "elastic/common/quoted.h"

namespace vantrel::elastic::check {

VectorsCheck::VectorsCheck(const VectorSources& sources, const std::vector<format::FieldInfo>& fields,
                           const StoreSlice& slice)
    : fields_(fields),
      slice_(slice),
      reader_(sources.index, sources.documents, sources.fields, static_cast<uint32_t>(fields.size())) {
  const uint64_t needed = slice_.first + slice_.count;
  if (slice_.is_shared ? reader_.documents() >= needed : reader_.documents() == needed) return;
  Refuse(Grade::kUnsafe, reader_.index().name(), reader_.index().size(),
         "term vectors of " + std::to_string(needed) + " documents", std::to_string(reader_.documents()));
}

void VectorsCheck::Run() {
  knows_ends_ = slice_.first == 0;
  list_end_ = terms_end_ = format::TermVectorsReader::header_size();
  for (uint64_t document = 0; document < slice_.count; ++document) {
    CheckDocument(document);
    CheckStart(document);
    list_end_ = reader_.list_end();
    if (!reader_.fields().empty()) {
      terms_end_ = reader_.terms_end();
    } else if (reader_.index_tells_terms_start()) {
      terms_end_ = reader_.terms_start();
    }
    knows_ends_ = true;
  }
  if (knows_ends_) CheckEnd();
}

void VectorsCheck::CheckStart(uint64_t document) const {
  if (!knows_ends_) return;
  const uint64_t offset = reader_.PointerOffset(slice_.first + document);
  RequireEqual(Grade::kUnsafe, reader_.index().name(), offset, "the document's fields at", list_end_,
               reader_.list_start());
  if (!reader_.index_tells_terms_start() && reader_.fields().empty()) return;
  RequireEqual(Grade::kUnsafe, reader_.index().name(), offset, "the document's terms at", terms_end_,
               reader_.terms_start());
}

// What follows belongs to another segment, or there is nothing.
void VectorsCheck::CheckEnd() {
  const uint64_t next = slice_.first + slice_.count;
  if (next == reader_.documents()) {
    RequireEqual(Grade::kDamaged, reader_.document_list().name(), list_end_,
                 "the documents' fields to end at", list_end_, reader_.document_list().size());
    RequireEqual(Grade::kDamaged, reader_.terms().name(), terms_end_, "the terms to end at", terms_end_,
                 reader_.terms().size());
  }
}

void VectorsCheck::CheckDocument(uint64_t document) {
  reader_.Seek(slice_.first + document);
  for (size_t i = 0; i < reader_.fields().size(); ++i) CheckTerms(i);
}

void VectorsCheck::CheckTerms(size_t field) {
  const format::TermVectorsReader::Field& place = reader_.fields()[field];
  const format::FieldInfo& info = fields_[place.number];
  if (!info.has_vectors) {
    // The list may have slipped: what follows in it would then be read as something else.
    Refuse(Grade::kUnsafe, reader_.document_list().name(), place.offset,
           "number of a field with term vectors",
           std::to_string(place.number) + ", which is " + Quoted(info.name));
  }
  if (field > 0) {
    RequireEqual(Grade::kUnsafe, reader_.document_list().name(), place.offset, "field with its terms at",
                 reader_.terms_end(), reader_.TermsStart(field));
  }
  reader_.SeekTerms(field);
  const int known = (info.has_vector_positions ? format::TermVectorsReader::kPositions : 0) |
                    (info.has_vector_offsets ? format::TermVectorsReader::kOffsets : 0);
  if ((reader_.flags() & ~known) != 0) {
    Refuse(Grade::kUnsafe, reader_.terms().name(), reader_.TermsStart(field),
           "flags of " + std::to_string(known) + ", as the field has them, or fewer",
           std::to_string(reader_.flags()));
  }
  reader_.PassTerms();
}

}  // namespace vantrel::elastic::check
