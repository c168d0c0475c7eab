#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/byte_source.h"

namespace vantrel::elastic::format {

// Dictionaries of this format and newer ones (smaller numbers) have skip data of the layout below.
inline constexpr int32_t kFormatWithSkipLists = -2;

// More levels than a term can have with any interval. The writer allows 10.
inline constexpr int32_t kMostSkipLevels = 32;

// The skip data of a term, which lets a reader jump ahead in its postings (.frq, behind the term's documents).
// With a skip interval of n, level 0 has an entry at each n-th document, level 1 at each n*n-th, and so on, as far
// as the document frequency reaches and the dictionary's header allows. Layout:
//
//   from the highest level down to level 1: VLong length in bytes, the level's entries
//   level 0: its entries, without a length
//
// An entry describes the place before its document, from the level's entry before (the first: from document 0 and
// the term's own pointers):
//
//   VInt distance of the document before that place
//     where the field has payloads: VInt twice that, plus 1 where the payload length follows
//       VInt length of the last payload, else it is the one of the level's entry before
//   VInt distance in .frq, VInt distance in .prx (of both, the lower 32 bits)
//   but on level 0: VLong where, in the level below, its entry for the same place ends (before its own VLong)
//
// Memory is a few buffers, whatever the length. For one thread at a time.
class SkipListReader {
 public:
  struct Entry {
    uint64_t offset = 0;  // in the file
    uint32_t document = 0;
    uint64_t postings_distance = 0;   // from the term's postings pointer; the lower 32 bits are certain
    uint64_t positions_distance = 0;  // from its positions pointer, the same
    std::optional<uint32_t> payload_length;
    uint64_t child = 0;  // from the beginning of the level below
    uint64_t end = 0;    // of the entry without `child`, from the beginning of its level
  };

  static constexpr size_t kSkipBufferSize = 4096;

  SkipListReader(std::shared_ptr<const ByteSource> source, int32_t skip_interval, int32_t most_levels,
                 size_t buffer_size = kSkipBufferSize);

  // Moves before the first entry of each level of a term. Throws IndexDamagedError, IndexIoError, as does Next().
  void Seek(uint64_t pointer, int32_t document_frequency, bool has_payloads);

  // Seek() that takes from the buffer of `lender`, which reads the same source, what it holds of the skip data. GiveBack()
  // must come before the next Seek() and before Next() once that buffer has changed (ByteReader::Borrow).
  void SeekBorrowing(const ByteReader& lender, uint64_t pointer, int32_t document_frequency,
                     bool has_payloads);
  void GiveBack();

  // Where a reader jumps to that looks for a document: behind the last place that lies before it.
  struct Landing {
    int32_t passed =
        0;  // documents of the term; 0 where no jump is worth it, and all else is of no meaning then
    Entry entry;
  };

  // Goes down the levels to the first document `target` or beyond, the way the index library does, entry by entry,
  // and reads no others. To be called once after Seek(). Documents ascend and stay below `document_count`, and
  // places in the level below lie in it: what the library reads on the way lies within the term's skip data, or the
  // file. The highest level, which it takes into memory, has at most 16 MiB.
  Landing SkipTo(int32_t target, int32_t document_count);

  // How many levels the term has; 0 before the first Seek().
  int levels() const { return level_count_; }

  // The next entry of a level, valid until the next call for that level.
  const Entry& Next(int level);

  // Where the level's next entry would begin, and where it must not: the end is known above level 0 only.
  uint64_t offset(int level) const { return levels_[static_cast<size_t>(level)].next; }
  uint64_t end(int level) const { return levels_[static_cast<size_t>(level)].end; }

 private:
  struct Level {
    explicit Level(std::shared_ptr<const ByteSource> source, size_t buffer_size)
        : reader(std::move(source), buffer_size) {}

    ByteReader reader;
    uint64_t start = 0;
    uint64_t next = 0;
    uint64_t end = 0;
    Entry entry;
    int64_t passed = 0;  // documents before the next entry's place, by SkipTo()
  };

  void Prepare(int32_t document_frequency, bool has_payloads);
  void SeekLevels(uint64_t pointer);
  void RequireLength(const ByteReader& reader, uint64_t pointer, int number, uint64_t length) const;
  void RequireShortTop() const;
  void ReadEntry(int number);
  bool LoadNext(int number, int64_t interval, uint32_t document_count);
  void Descend(int number, const Entry& from, int64_t passed);
  int LevelsOf(int32_t document_frequency) const;

  std::shared_ptr<const ByteSource> source_;
  int32_t skip_interval_;
  int32_t most_levels_;
  size_t buffer_size_;  // of each level
  bool has_payloads_ = false;
  int32_t document_frequency_ = 0;
  int level_count_ = 0;
  std::vector<Level> levels_;
};

}  // namespace vantrel::elastic::format
