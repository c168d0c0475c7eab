#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "elastic/format/commit/commit.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/segment/compound_file.h"
#include "elastic/format/segment/deletions.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"

namespace vantrel::elastic::lookup {

// A term that will be looked up, in UTF-8.
struct WantedTerm {
  std::string field;
  std::string text;
};

// Where a lookup in a segment's dictionary begins: behind a term that the index over it holds.
struct LookupPlace {
  uint64_t number = 0;  // of the index's entry
  format::TermPlace place;
};

// What the index library holds of a segment once it has opened it: the very files, and what was read of them.
struct OpenedSegment {
  using Source = std::shared_ptr<const format::ByteSource>;

  format::SegmentInfo info;
  std::optional<format::CompoundFile> compound = {};
  std::optional<format::CompoundFile> store_compound = {};
  std::map<std::string, Source> plain = {};        // by extension, such as ".tis"
  std::map<std::string, Source> plain_store = {};  // the same of the document store
  std::vector<format::FieldInfo> fields = {};
  std::shared_ptr<format::Deletions> deletions = {};  // empty where nothing is deleted
  std::optional<LookupPlace> place = {};  // of the wanted term; empty where the index has none for it

  bool has_own_store() const { return info.store_offset == format::SegmentInfo::kOwnStore; }

  // A file of the segment, and one of its document store; empty where there is none. Thrown is IndexDamagedError.
  Source Core(const std::string& extension) const;
  Source Store(const std::string& extension) const;

  // By its name; null where the segment has no such field.
  const format::FieldInfo* FindField(const std::string& name) const;
};

}  // namespace vantrel::elastic::lookup
