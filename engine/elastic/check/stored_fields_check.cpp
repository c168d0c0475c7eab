#include "elastic/check/stored_fields_check.h"

#include <utility>

#include "elastic/check/mismatch.h"

namespace vantrel::elastic::check {

StoredFieldsCheck::StoredFieldsCheck(std::shared_ptr<const format::ByteSource> index,
                                     std::shared_ptr<const format::ByteSource> records,
                                     const std::vector<format::FieldInfo>& fields, const StoreSlice& slice)
    : fields_(fields), slice_(slice), reader_(std::move(index), std::move(records)) {
  const uint64_t needed = slice_.first + slice_.count;
  if (slice_.is_shared ? reader_.documents() >= needed : reader_.documents() == needed) return;
  Refuse(Grade::kUnsafe, reader_.index().name(), reader_.index().size(),
         "stored fields of " + std::to_string(needed) + " documents", std::to_string(reader_.documents()));
}

void StoredFieldsCheck::Run() {
  if (slice_.count == 0 && !slice_.is_shared) {
    RequireEqual(Grade::kDamaged, reader_.records().name(), reader_.header_size(), "no more bytes than",
                 reader_.header_size(), reader_.records().size());
  }
  for (uint64_t document = 0; document < slice_.count; ++document) {
    CheckDocument(document);
    if (document == 0 && slice_.first == 0) {
      RequireEqual(Grade::kUnsafe, reader_.index().name(), reader_.header_size(), "the first record at",
                   reader_.header_size(), reader_.start());
    }
  }
}

void StoredFieldsCheck::CheckDocument(uint64_t document) {
  reader_.Seek(slice_.first + document);
  const std::string& file = reader_.records().name();
  while (reader_.Next()) {
    if (reader_.number() >= fields_.size()) {
      Refuse(Grade::kUnsafe, file, reader_.field_offset(),
             "field number below " + std::to_string(fields_.size()), std::to_string(reader_.number()));
    }
    if ((reader_.flags() & ~reader_.known_flags()) != 0) {
      Refuse(Grade::kUnsafe, file, reader_.field_offset(), "flags of a stored field",
             std::to_string(reader_.flags()));
    }
    reader_.PassValue();
  }
  RequireEqual(Grade::kUnsafe, file, reader_.records().offset(), "record to end at", reader_.end(),
               reader_.records().offset());
}

}  // namespace vantrel::elastic::check
