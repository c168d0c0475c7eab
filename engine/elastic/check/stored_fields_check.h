#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/stored_fields.h"

namespace vantrel::elastic::check {

// Which documents of a document store are a segment's.
struct StoreSlice {
  uint64_t first = 0;
  uint64_t count = 0;
  bool is_shared = false;  // the store may hold others
};

// Checks the stored fields of a segment's documents. For one thread at a time.
class StoredFieldsCheck {
 public:
  // Throws Mismatch, IndexDamagedError, IndexIoError, as does everything below.
  StoredFieldsCheck(std::shared_ptr<const format::ByteSource> index,
                    std::shared_ptr<const format::ByteSource> records,
                    const std::vector<format::FieldInfo>& fields, const StoreSlice& slice);

  // All documents; their records must lie one behind the other.
  void Run();

  // One document, counted from the segment's first.
  void CheckDocument(uint64_t document);

 private:
  const std::vector<format::FieldInfo>& fields_;
  StoreSlice slice_;
  format::StoredFieldsReader reader_;
};

}  // namespace vantrel::elastic::check
