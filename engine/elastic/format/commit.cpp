#include "elastic/format/commit.h"

#include <zlib.h>

#include <algorithm>
#include <exception>
#include <optional>
#include <utility>

#include "elastic/format/byte_reader.h"
#include "elastic/format/field_infos.h"
#include "elastic/format/file_names.h"
#include "elastic/format/quoted.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// Format numbers, each named after what it brought.
constexpr int32_t kWithGenerations = -2;
constexpr int32_t kWithSingleNorms = -3;
constexpr int32_t kWithSharedStores = -4;
constexpr int32_t kWithChecksum = -5;
constexpr int32_t kWithDeletionCount = -6;
constexpr int32_t kWithHasPositions = -7;
constexpr int32_t kWithUserData = -8;
constexpr int32_t kWithDiagnostics = -9;
static_assert(kWithDiagnostics == kNewestCommitFormat);

constexpr int32_t kMostSegments = int32_t{1} << 16;

void SkipString(ByteReader& reader) { reader.Skip(reader.ReadVInt()); }

void SkipStringMap(ByteReader& reader) {
  for (int32_t left = reader.ReadInt(); left > 0; --left) {
    SkipString(reader);
    SkipString(reader);
  }
}

std::optional<std::vector<int64_t>> ReadNormGenerations(ByteReader& reader) {
  const uint64_t start = reader.offset();
  const int32_t count = reader.ReadInt();
  if (count == -1) return std::nullopt;
  if (count < 0 || count > kMostFields || static_cast<uint64_t>(count) > reader.remaining() / 8) {
    reader.Damaged(start, "count of norm generations is " + std::to_string(count));
  }
  std::vector<int64_t> generations(static_cast<size_t>(count));
  for (int64_t& generation : generations) generation = reader.ReadLong();
  return generations;
}

SegmentInfo::Compound ReadCompound(ByteReader& reader) {
  const uint8_t value = reader.ReadByte();
  if (value == 1) return SegmentInfo::Compound::kYes;
  return value == 0xff ? SegmentInfo::Compound::kNo : SegmentInfo::Compound::kLookForFile;
}

std::string ReadSegmentName(ByteReader& reader) {
  const uint64_t start = reader.offset();
  std::string name = reader.ReadString();
  if (!IsSegmentName(name)) reader.Damaged(start, "segment name is not '_' and a number in base 36");
  return name;
}

void ReadStore(ByteReader& reader, SegmentInfo& segment) {
  segment.store_offset = reader.ReadInt();
  if (segment.store_offset == SegmentInfo::kOwnStore) return;
  segment.store_segment = ReadSegmentName(reader);
  segment.store_is_compound = reader.ReadByte() == 1;
}

SegmentInfo ReadSegment(ByteReader& reader, int32_t format) {
  SegmentInfo segment;
  segment.name = ReadSegmentName(reader);
  const uint64_t count_start = reader.offset();
  segment.document_count = reader.ReadInt();
  if (segment.document_count < 0) {
    reader.Damaged(count_start, "document count is " + std::to_string(segment.document_count));
  }
  if (format > kWithGenerations) {
    segment.deletions_generation = SegmentInfo::kLookForDeletions;
    return segment;
  }
  const uint64_t generation_start = reader.offset();
  segment.deletions_generation = reader.ReadLong();
  if (segment.deletions_generation < SegmentInfo::kNoDeletions) {
    reader.Damaged(generation_start,
                   "generation of deletions is " + std::to_string(segment.deletions_generation));
  }
  if (format <= kWithSharedStores) ReadStore(reader, segment);
  if (format <= kWithSingleNorms) segment.has_norms_file = reader.ReadByte() == 1;
  segment.norm_generations = ReadNormGenerations(reader);
  segment.compound = ReadCompound(reader);
  if (format <= kWithDeletionCount) segment.deleted_count = reader.ReadInt();
  if (format <= kWithHasPositions) segment.has_positions = reader.ReadByte() == 1;
  if (format <= kWithDiagnostics) SkipStringMap(reader);
  return segment;
}

void SkipUserData(ByteReader& reader, int32_t format) {
  if (format <= kWithDiagnostics) {
    SkipStringMap(reader);
  } else if (format == kWithUserData && reader.ReadByte() != 0) {
    SkipString(reader);
  }
}

void CheckChecksum(const ByteSource& source, ByteReader& reader, CommitChecksum kind) {
  const uint64_t end = reader.offset();
  if (kind == CommitChecksum::kPassOver) {
    reader.ReadLong();
    return;
  }
  uLong checksum = crc32(0, nullptr, 0);
  std::vector<uint8_t> piece(ByteReader::kDefaultBufferSize);
  for (uint64_t offset = 0; offset < end;) {
    const auto length = static_cast<size_t>(std::min<uint64_t>(piece.size(), end - offset));
    source.ReadAt(offset, std::span(piece.data(), length));
    checksum = crc32(checksum, piece.data(), static_cast<uInt>(length));
    offset += length;
  }
  const auto expected = static_cast<uint64_t>(reader.ReadLong());
  if (expected != checksum) {
    reader.Damaged(
        end, "checksum is " + std::to_string(checksum) + ", but the file says " + std::to_string(expected));
  }
}

int64_t NewestGeneration(const Folder& folder) {
  return std::max(ListedGeneration(folder), HintedGeneration(folder));
}

}  // namespace

int64_t ListedGeneration(const Folder& folder) {
  int64_t newest = -1;
  for (const std::string& name : folder.List()) {
    if (!name.starts_with(kSegments) || name == kSegmentsGen) continue;
    const std::optional<int64_t> generation = CommitGeneration(name);
    if (!generation.has_value()) {
      throw IndexError(folder.path(), Quoted(name) + " stands for a commit, but holds no generation");
    }
    newest = std::max(newest, *generation);
  }
  return newest;
}

int64_t HintedGeneration(const Folder& folder) {
  try {
    ByteReader reader(folder.Open(std::string(kSegmentsGen)));
    if (reader.ReadInt() != kWithGenerations) return -1;
    const int64_t first = reader.ReadLong();
    return first == reader.ReadLong() ? first : -1;
  } catch (const IndexError&) {
    return -1;
  }
}

Commit ReadCommit(const std::shared_ptr<const ByteSource>& source, int64_t generation,
                  CommitChecksum checksum) {
  if (source->size() > kLargestCommit) {
    throw IndexError(source->name(), std::to_string(source->size()) + " bytes are too many for a commit");
  }
  ByteReader reader(source);
  Commit commit;
  commit.generation = generation;
  int32_t format = reader.ReadInt();
  if (format < kNewestCommitFormat) {
    reader.Damaged(0, "format is " + std::to_string(format) + ", but " + std::to_string(kNewestCommitFormat) +
                          " is the newest known");
  }
  commit.format = std::min(format, 0);
  commit.counter = format;
  if (format < 0) {
    reader.ReadLong();
    commit.counter = reader.ReadInt();
  }
  const uint64_t count_start = reader.offset();
  const int32_t count = reader.ReadInt();
  if (count < 0 || count > kMostSegments) {
    reader.Damaged(count_start, "segment count is " + std::to_string(count));
  }
  for (int32_t i = 0; i < count; ++i) commit.segments.push_back(ReadSegment(reader, format));
  if (format < 0) SkipUserData(reader, format);
  if (format <= kWithChecksum) CheckChecksum(*source, reader, checksum);
  // The oldest layout may have its version here.
  if (format >= 0 && reader.remaining() >= 8) reader.ReadLong();
  commit.end = reader.offset();
  commit.size = reader.size();
  return commit;
}

void UseNewestCommit(const Folder& folder, const std::function<void(Commit)>& use) {
  const auto use_generation = [&](int64_t generation) {
    use(ReadCommit(folder.Open(CommitFileName(generation)), generation));
  };
  int64_t generation = NewestGeneration(folder);
  if (generation < 0) throw IndexError(folder.path(), "no index in this folder: it holds no segments file");
  for (bool tried_again = false;;) {
    std::exception_ptr failure;
    try {
      return use_generation(generation);
    } catch (const IndexError&) {
      failure = std::current_exception();
    }
    if (generation > 1 && folder.Exists(CommitFileName(generation - 1))) {
      try {
        return use_generation(generation - 1);
      } catch (const IndexError&) {
        // The newer commit's failure says more.
      }
    }
    const int64_t newest = NewestGeneration(folder);
    // The same again, but once: its writer may have completed it, and dropped the one before, just now.
    if (newest < generation || (newest == generation && tried_again)) std::rethrow_exception(failure);
    tried_again = newest == generation;
    generation = newest;
  }
}

Commit ReadNewestCommit(const Folder& folder) {
  Commit newest;
  UseNewestCommit(folder, [&](Commit commit) { newest = std::move(commit); });
  return newest;
}

}  // namespace vantrel::elastic::format
