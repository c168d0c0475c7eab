#include "elastic/format/segment/skip_list.h"

#include <string>
#include <utility>

namespace vantrel::elastic::format {
namespace {

// Five numbers of up to 5, 5, 5, 5 and 9 bytes.
constexpr uint64_t kLongestEntry = 29;

}  // namespace

SkipListReader::SkipListReader(std::shared_ptr<const ByteSource> source, int32_t skip_interval,
                               int32_t most_levels, size_t buffer_size)
    : source_(std::move(source)),
      skip_interval_(skip_interval),
      most_levels_(most_levels),
      buffer_size_(buffer_size) {}

int SkipListReader::LevelsOf(int32_t document_frequency) const {
  int levels = 0;
  // An interval of 1 would have no end.
  const int32_t divisor = skip_interval_ < 2 ? 2 : skip_interval_;
  for (int32_t left = document_frequency; left >= divisor && levels < most_levels_; left /= divisor) ++levels;
  return levels;
}

void SkipListReader::Prepare(int32_t document_frequency, bool has_payloads) {
  has_payloads_ = has_payloads;
  document_frequency_ = document_frequency;
  level_count_ = LevelsOf(document_frequency);
  while (levels_.size() < static_cast<size_t>(level_count_)) levels_.emplace_back(source_, buffer_size_);
}

void SkipListReader::Seek(uint64_t pointer, int32_t document_frequency, bool has_payloads) {
  Prepare(document_frequency, has_payloads);
  SeekLevels(pointer);
}

void SkipListReader::SeekBorrowing(const ByteReader& lender, uint64_t pointer, int32_t document_frequency,
                                   bool has_payloads) {
  Prepare(document_frequency, has_payloads);
  for (Level& level : levels_) level.reader.Borrow(lender);
  SeekLevels(pointer);
}

void SkipListReader::GiveBack() {
  for (Level& level : levels_) level.reader.GiveBack();
}

void SkipListReader::SeekLevels(uint64_t pointer) {
  for (int number = level_count_ - 1; number >= 0; --number) {
    Level& level = levels_[static_cast<size_t>(number)];
    level.entry = Entry();
    level.passed = 0;
    level.reader.Seek(pointer);
    level.end = level.reader.size();
    level.start = pointer;
    if (number > 0) {
      const uint64_t length = level.reader.ReadVLong();
      RequireLength(level.reader, pointer, number, length);
      level.start = level.reader.offset();
      level.end = level.start + length;
    }
    level.next = level.start;
    pointer = level.end;
  }
}

// The index library takes the highest level into memory, however long it says to be.
void SkipListReader::RequireLength(const ByteReader& reader, uint64_t pointer, int number,
                                   uint64_t length) const {
  auto entries = static_cast<uint64_t>(document_frequency_);
  for (int level = 0; level <= number && skip_interval_ > 1; ++level)
    entries /= static_cast<uint64_t>(skip_interval_);
  const std::string what =
      "level " + std::to_string(number) + " of skip data takes " + std::to_string(length);
  if (length > reader.remaining()) {
    reader.Damaged(pointer, what + " bytes, but the file ends at " + std::to_string(reader.size()));
  }
  if (length > entries * kLongestEntry) {
    reader.Damaged(pointer, what + " bytes for " + std::to_string(entries) + " entries");
  }
}

// Few entries are left on the highest level, unless there may be so few levels that it is of no use.
void SkipListReader::RequireShortTop() const {
  constexpr uint64_t kMost = uint64_t{16} << 20;
  if (level_count_ < 2) return;
  const Level& top = levels_[static_cast<size_t>(level_count_ - 1)];
  if (top.end - top.start <= kMost) return;
  top.reader.Damaged(top.start, "the highest level of skip data takes " +
                                    std::to_string(top.end - top.start) +
                                    " bytes, which the index library would take into memory");
}

const SkipListReader::Entry& SkipListReader::Next(int number) {
  Level& level = levels_[static_cast<size_t>(number)];
  ByteReader& reader = level.reader;
  Entry& entry = level.entry;
  entry.offset = level.next;
  if (entry.offset >= level.end) {
    reader.Damaged(entry.offset, "level " + std::to_string(number) + " of skip data has too few entries");
  }
  try {
    ReadEntry(number);
  } catch (const EndOfFileError&) {
    // Where the length of a level is known, the index library does not look at the end of the file any more.
    if (number == 0) throw;
    reader.Damaged(entry.offset, "skip entry reaches past its level's end at " + std::to_string(level.end));
  }
  if (level.next > level.end) {
    reader.Damaged(entry.offset, "skip entry reaches past its level's end at " + std::to_string(level.end));
  }
  return entry;
}

void SkipListReader::ReadEntry(int number) {
  Level& level = levels_[static_cast<size_t>(number)];
  ByteReader& reader = level.reader;
  Entry& entry = level.entry;
  uint32_t distance = reader.ReadVInt();
  if (has_payloads_) {
    if ((distance & 1) != 0) entry.payload_length = reader.ReadVInt();
    distance >>= 1;
  }
  entry.document += distance;
  // Signed, as the index library adds them.
  entry.postings_distance += static_cast<uint64_t>(int64_t{static_cast<int32_t>(reader.ReadVInt())});
  entry.positions_distance += static_cast<uint64_t>(int64_t{static_cast<int32_t>(reader.ReadVInt())});
  entry.end = reader.offset() - level.start;
  entry.child = number > 0 ? reader.ReadVLong() : 0;
  level.next = reader.offset();
}

// False where the level has no more entries.
bool SkipListReader::LoadNext(int number, int64_t interval, uint32_t document_count) {
  Level& level = levels_[static_cast<size_t>(number)];
  level.passed += interval;
  if (level.passed > document_frequency_) return false;
  const uint32_t before = level.entry.document;
  const Entry& entry = Next(number);
  if (entry.document >= document_count || entry.document < before) {
    level.reader.Damaged(entry.offset, "skip entry leads from document " + std::to_string(before) + " to " +
                                           std::to_string(entry.document) + " of " +
                                           std::to_string(document_count));
  }
  return true;
}

// Moves a level to the place where the entry `from` of the level above leads.
void SkipListReader::Descend(int number, const Entry& from, int64_t passed) {
  Level& level = levels_[static_cast<size_t>(number)];
  if (from.child > level.end - level.start) {
    level.reader.Damaged(from.offset, "skip entry leads to byte " + std::to_string(from.child) +
                                          " of a level of " + std::to_string(level.end - level.start));
  }
  level.reader.Seek(level.start + from.child);
  level.entry = from;
  level.entry.child = number > 0 ? level.reader.ReadVLong() : 0;
  level.next = level.reader.offset();
  level.passed = passed;
}

SkipListReader::Landing SkipListReader::SkipTo(int32_t target, int32_t document_count) {
  Landing landing;
  RequireShortTop();  // the library takes it into memory whatever the target is
  if (target <= 0) return landing;
  int64_t interval = skip_interval_;
  for (int number = 1; number < level_count_; ++number) {
    interval *= skip_interval_;
    const Level& level = levels_[static_cast<size_t>(number)];
    if (level.start == level.end)
      level.reader.Damaged(level.start, "level " + std::to_string(number) + " is empty");
  }
  for (int number = level_count_ - 1; number >= 0; --number, interval /= skip_interval_) {
    Level& level = levels_[static_cast<size_t>(number)];
    do {
      landing.entry = level.entry;
    } while (LoadNext(number, interval, static_cast<uint32_t>(document_count)) &&
             static_cast<int64_t>(level.entry.document) < target);
    const int64_t passed = level.passed - interval;
    if (number == 0) {
      landing.passed = static_cast<int32_t>(passed > 0 ? passed - 1 : 0);
    } else if (landing.entry.child > 0) {
      Descend(number - 1, landing.entry, passed);
    }
  }
  return landing;
}

}  // namespace vantrel::elastic::format
