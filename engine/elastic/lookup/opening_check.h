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
// deleted documents counted wrongly. Where the library finds out by itself (a version that is too new, a wrong checksum,
// a file that is too short, a missing one), it is left to it. For one thread at a time.
//
// The library keeps the names of all fields and sub-files, a bit for each document of a segment with deleted ones, and
// the index over each dictionary. So refused, too, although nothing is wrong with it, is an index of which the first two
// would take more than kMostMemory: that is some 130,000 names of a few bytes, or 90,000 of 20. The index over a
// dictionary may be as large as it is on disk, but its texts may grow only so much by what they share.
class OpeningCheck {
 public:
  static constexpr uint64_t kMostMemory = uint64_t{88} << 20;
  // The texts in the index over a dictionary may become kMostIndexGrowth times the size of the file, and of all files
  // kFreeIndexCharacters beyond. The library takes four bytes for a character.
  static constexpr uint64_t kMostIndexGrowth = 16;
  static constexpr uint64_t kFreeIndexCharacters = uint64_t{2} << 20;

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
  void CountMemory(const std::string& file, uint64_t bytes);
  void CountIndexText(const format::TermCursor& index);
  OpenedSegment* FindSegment(const std::string& name);

  std::optional<WantedTerm> term_;
  std::vector<OpenedSegment> segments_;
  OpenedSegment* current_ = nullptr;  // the one that is being opened
  // In all segments so far.
  uint64_t memory_ = 0;            // estimated
  uint64_t index_characters_ = 0;  // of texts in the index over a dictionary
  uint64_t index_bytes_ = 0;       // of those files, but for the one that is read
};

}  // namespace vantrel::elastic::lookup
