#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/segment/segment_files.h"
#include "elastic/terms/live_term_filter.h"
#include "vantrel/elastic/library_types.h"

namespace vantrel::elastic {

// What stands behind a TermDict: one pass over a segment's dictionary, all terms or the live ones only.
class TermWalk {
 public:
  TermWalk(format::SegmentFiles files, bool live_only);

  const std::string& segment_name() const { return files_.info.name; }
  const std::string& dictionary_name() const { return files_.terms->name(); }

  // The number of terms from first to last; counted by a pass of its own where the header does not tell.
  uint64_t Count();

  bool Next();
  Lucene::TermPtr Term();

 private:
  format::TermCursor OpenCursor() const;
  bool IsWanted(const format::TermCursor& cursor);
  const Lucene::String& WideFieldName(int32_t field);

  format::SegmentFiles files_;
  std::vector<format::FieldInfo> fields_;
  format::TermCursor cursor_;
  std::optional<LiveTermFilter> live_filter_;
  std::optional<uint64_t> count_;
  bool at_term_ = false;
  int32_t wide_field_number_ = -1;
  Lucene::String wide_field_;
  Lucene::TermPtr term_;
};

}  // namespace vantrel::elastic
