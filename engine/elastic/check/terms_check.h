#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "elastic/check/postings_check.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/format/segment/term_order.h"

namespace vantrel::elastic::check {

// The files of a segment's terms.
struct TermSources {
  std::shared_ptr<const format::ByteSource> dictionary;  // .tis
  std::shared_ptr<const format::ByteSource> index;       // .tii
  std::shared_ptr<const format::ByteSource> postings;    // .frq
  std::shared_ptr<const format::ByteSource> positions;   // .prx; empty where no field has any
};

// Checks the terms of a segment: the dictionary, the index over it, and the postings of every term, which must lie
// one behind the other and fill their files. Takes time in proportion to the bytes of these files, and memory for two
// texts. For one thread at a time.
class TermsCheck {
 public:
  // Throws Mismatch, IndexDamagedError, IndexIoError, as does Run().
  TermsCheck(const TermSources& sources, const std::vector<format::FieldInfo>& fields,
             int32_t document_count);

  void Run();

 private:
  void CheckHeaders() const;
  void CheckTerm();
  void CheckText(const format::FieldInfo& field);
  void CheckIndexEntry();
  void CheckPlace() const;
  void CheckEnds() const;

  const std::vector<format::FieldInfo>& fields_;
  TermSources sources_;
  format::TermCursor dictionary_;
  format::TermCursor index_;
  format::FieldOrder field_order_;
  format::OrderOfTerms order_;
  PostingsCheck postings_;
  uint64_t number_ = 0;  // of the term at the cursor
  size_t same_text_ =
      0;  // how much of its text the dictionary's cursor and the index's have in common, at least
};

}  // namespace vantrel::elastic::check
