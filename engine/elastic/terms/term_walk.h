#pragma once

#include <lucene++/Lucene.h>

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/dictionary_walk.h"
#include "elastic/format/field_infos.h"
#include "elastic/format/segment_files.h"
#include "elastic/format/term_cursor.h"
#include "elastic/terms/live_term_filter.h"

namespace vantrel::elastic {

// What stands behind a TermDict: one pass over a segment's dictionary, all terms or the live ones only.
class TermWalk {
 public:
  TermWalk(format::SegmentFiles files, bool live_only);

  const std::string& segment_name() const { return files_.info.name; }
  const std::string& dictionary_name() const { return files_.terms->name(); }

  // The number of terms from first to last; counted by a pass of its own where the header does not tell.
  uint64_t Count();

  void StartNear(const std::string& field, std::string_view text);
  bool Next();
  Lucene::TermPtr Term();

 private:
  format::TermCursor OpenCursor() const;
  const format::TermCursor& cursor() const { return near_ != nullptr ? near_->cursor() : cursor_; }
  bool IsWanted(const format::TermCursor& cursor);
  const Lucene::String& WideFieldName(int32_t field);

  format::SegmentFiles files_;
  std::vector<format::FieldInfo> fields_;
  format::TermCursor cursor_;
  std::unique_ptr<format::DictionaryWalk> near_;  // instead of the cursor, where the walk begins elsewhere
  std::optional<LiveTermFilter> live_filter_;
  std::optional<uint64_t> count_;
  bool at_term_ = false;
  int32_t wide_field_number_ = -1;
  Lucene::String wide_field_;
  Lucene::TermPtr term_;
};

}  // namespace vantrel::elastic
