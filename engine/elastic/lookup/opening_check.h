#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "elastic/format/io/byte_source.h"
#include "elastic/lookup/opened_segment.h"

namespace vantrel::elastic::lookup {

// Goes along while the index library opens an index, and checks of every file what the library is about to read of
// it, before it does: the commit, the tables of compound files, field names, the dictionary's header, the whole index
// over it, and deleted documents. Nothing else is read then.
//
// Refused is what the library could crash on, run astray on or take gigabytes for, and what contradicts itself, such as
// deleted documents counted wrongly; also more than 131,072 fields and sub-files in all segments together, and names of
// more than 4 MiB, all of which the library keeps in memory, so that opening takes less than 128 MiB. Where the library finds out by itself (a version that is too new, a wrong
// checksum, a file that is too short, a missing one), it is left to it. For one thread at a time.
class OpeningCheck {
 public:
  // The place of `term` in the dictionaries is noted on the way.
  explicit OpeningCheck(std::optional<WantedTerm> term);

  // Checks a file, by its name in the folder, that the library has asked for. Throws IndexError.
  void Check(const std::string& name, const std::shared_ptr<const format::ByteSource>& source);

  // The segments of the commit that was opened last, in its order, and what was opened of them. Empties the check.
  std::vector<OpenedSegment> TakeSegments();

 private:
  using Source = OpenedSegment::Source;

  void CheckCommit(const Source& source, int64_t generation);
  void CheckFields(const Source& source);
  void CheckDictionary(const Source& source) const;
  void CheckTermsIndex(const Source& source);
  void CheckCompound(const Source& source);
  void CountSubFiles(const format::CompoundFile& compound);
  void CountName(const std::string& file, const std::string& name);
  OpenedSegment* FindSegment(const std::string& name);

  std::optional<WantedTerm> term_;
  std::vector<OpenedSegment> segments_;
  OpenedSegment* current_ = nullptr;  // the one that is being opened
  uint64_t names_ = 0;                // of fields and sub-files, in all segments so far
  uint64_t name_bytes_ = 0;
};

}  // namespace vantrel::elastic::lookup
