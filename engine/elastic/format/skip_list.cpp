#include "elastic/format/skip_list.h"

#include <string>
#include <utility>

namespace vantrel::elastic::format {
namespace {

constexpr size_t kBufferSize = 4096;

}  // namespace

SkipListReader::SkipListReader(std::shared_ptr<const ByteSource> source, int32_t skip_interval,
                               int32_t most_levels)
    : source_(std::move(source)), skip_interval_(skip_interval), most_levels_(most_levels) {}

int SkipListReader::LevelsOf(int32_t document_frequency) const {
  int levels = 0;
  // An interval of 1 would have no end.
  const int32_t divisor = skip_interval_ < 2 ? 2 : skip_interval_;
  for (int32_t left = document_frequency; left >= divisor && levels < most_levels_; left /= divisor) ++levels;
  return levels;
}

void SkipListReader::Seek(uint64_t pointer, int32_t document_frequency, bool has_payloads) {
  has_payloads_ = has_payloads;
  level_count_ = LevelsOf(document_frequency);
  while (levels_.size() < static_cast<size_t>(level_count_)) levels_.emplace_back(source_, kBufferSize);
  for (int number = level_count_ - 1; number >= 0; --number) {
    Level& level = levels_[static_cast<size_t>(number)];
    level.entry = Entry();
    level.reader.Seek(pointer);
    level.end = level.reader.size();
    level.start = pointer;
    if (number > 0) {
      const uint64_t length = level.reader.ReadVLong();
      if (length > level.reader.remaining()) {
        level.reader.Damaged(pointer, "level " + std::to_string(number) + " of skip data takes " +
                                          std::to_string(length) + " bytes, but the file ends at " +
                                          std::to_string(level.reader.size()));
      }
      level.start = level.reader.offset();
      level.end = level.start + length;
    }
    level.next = level.start;
    pointer = level.end;
  }
}

const SkipListReader::Entry& SkipListReader::Next(int number) {
  Level& level = levels_[static_cast<size_t>(number)];
  ByteReader& reader = level.reader;
  Entry& entry = level.entry;
  entry.offset = level.next;
  if (entry.offset >= level.end) {
    reader.Damaged(entry.offset, "level " + std::to_string(number) + " of skip data has too few entries");
  }
  uint32_t distance = reader.ReadVInt();
  if (has_payloads_) {
    if ((distance & 1) != 0) entry.payload_length = reader.ReadVInt();
    distance >>= 1;
  }
  entry.document += distance;
  entry.postings_distance += reader.ReadVInt();
  entry.positions_distance += reader.ReadVInt();
  entry.end = reader.offset() - level.start;
  entry.child = number > 0 ? reader.ReadVLong() : 0;
  level.next = reader.offset();
  if (level.next > level.end) {
    reader.Damaged(entry.offset, "skip entry reaches past its level's end at " + std::to_string(level.end));
  }
  return entry;
}

}  // namespace vantrel::elastic::format
