#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "elastic/check/stored_fields_check.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_vectors.h"

namespace vantrel::elastic::check {

// The files of a segment's term vectors.
struct VectorSources {
  std::shared_ptr<const format::ByteSource> index;      // .tvx
  std::shared_ptr<const format::ByteSource> documents;  // .tvd
  std::shared_ptr<const format::ByteSource> fields;     // .tvf
};

// Checks the term vectors of a segment's documents. For one thread at a time.
class VectorsCheck {
 public:
  // Throws Mismatch, IndexDamagedError, IndexIoError, as does everything below.
  VectorsCheck(const VectorSources& sources, const std::vector<format::FieldInfo>& fields,
               const StoreSlice& slice);

  // All documents; their lists and terms must lie one behind the other.
  void Run();

  // One document, counted from the segment's first.
  void CheckDocument(uint64_t document);

 private:
  void CheckTerms(size_t field);
  void CheckStart(uint64_t document) const;
  void CheckEnd();

  const std::vector<format::FieldInfo>& fields_;
  StoreSlice slice_;
  format::TermVectorsReader reader_;
  bool knows_ends_ = false;  // where the document before ended
  uint64_t list_end_ = 0;
  uint64_t terms_end_ = 0;
};

}  // namespace vantrel::elastic::check
