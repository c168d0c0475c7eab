#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/positions.h"
#include "elastic/format/segment/postings.h"
#include "elastic/format/segment/skip_list.h"
#include "elastic/format/segment/term_cursor.h"

namespace vantrel::elastic::check {

// Checks what stands in .frq and .prx for one term after the other: documents, frequencies, positions, payloads,
// and every entry of the skip data against the documents that it skips. For one thread at a time.
class PostingsCheck {
 public:
  // `positions` is empty in a segment without any. The skip interval and levels are the dictionary's.
  PostingsCheck(const std::shared_ptr<const format::ByteSource>& postings,
                std::shared_ptr<const format::ByteSource> positions, int32_t document_count,
                const format::TermCursor& dictionary);

  // Checks the term at the dictionary's cursor. Throws Mismatch, IndexDamagedError, IndexIoError.
  void Check(const format::TermCursor& dictionary, const format::FieldInfo& field);

  // Where the term's data end, which Check() has passed.
  uint64_t postings_end() const { return postings_end_; }
  uint64_t positions_end() const { return positions_end_; }
  // False where skip data of a layout that nobody reads any more lie between postings_end() and the next term.
  bool is_end_exact() const { return is_end_exact_; }

  const format::PostingsReader& postings() const { return postings_; }

 private:
  void SeekSkips(const format::TermInfo& term, bool has_payloads);
  void GiveSkipsBack();
  void PassDocuments(const format::TermInfo& term);
  void PassPositions();
  void CompareSkips(const format::TermInfo& term, int32_t number);
  void CompareSkip(const format::TermInfo& term, int level, const format::SkipListReader::Entry& entry);
  void CheckSkipEnds(const format::TermCursor& dictionary);

  format::PostingsReader postings_;
  std::optional<format::PositionsReader> positions_;
  format::SkipListReader skips_;
  int32_t skip_interval_;
  bool reads_skips_;

  // Of the term under way.
  bool has_positions_ = false;
  bool has_skips_ = false;
  bool must_state_length_ = false;
  std::optional<uint64_t>
      borrowed_fill_;  // fills() of the postings' reader while the skip data borrow its buffer

  uint64_t postings_end_ = 0;
  uint64_t positions_end_ = 0;
  bool is_end_exact_ = true;
};

}  // namespace vantrel::elastic::check
