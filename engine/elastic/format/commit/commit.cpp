#include "elastic/format/commit/commit.h"

#include <zlib.h>

#include <algorithm>
#include <exception>
#include <limits>
#include <optional>
#include <string_view>
#include <tuple>
#include <unordered_set>
#include <utility>

#include "elastic/common/quoted.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/byte_reader.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/format/segment/field_infos.h"
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

// What a commit may still have.
struct Room {
  int64_t norm_generations = kMostNormGenerations;
  uint64_t strings = kMostCommitStrings;
  uint64_t string_bytes = kMostCommitStringBytes;
};

void SkipString(ByteReader& reader, Room& room) {
  const uint64_t start = reader.offset();
  const uint32_t length = reader.ReadVInt();
  reader.Skip(length);
  if (room.strings == 0 || length > room.string_bytes) {
    reader.Damaged(start, "the commit has more than " + std::to_string(kMostCommitStrings) +
                              " strings of diagnostics and user data, or they take more than " +
                              std::to_string(kMostCommitStringBytes) + " bytes");
  }
  --room.strings;
  room.string_bytes -= length;
}

void SkipStringMap(ByteReader& reader, Room& room) {
  for (int32_t left = reader.ReadInt(); left > 0; --left) {
    SkipString(reader, room);
    SkipString(reader, room);
  }
}

std::optional<std::vector<int64_t>> ReadNormGenerations(ByteReader& reader, Room& room) {
  const uint64_t start = reader.offset();
  const int32_t count = reader.ReadInt();
  if (count == -1) return std::nullopt;
  if (count < 0 || count > kMostFields || static_cast<uint64_t>(count) > reader.remaining() / 8) {
    reader.Damaged(start, "count of norm generations is " + std::to_string(count));
  }
  room.norm_generations -= count;
  if (room.norm_generations < 0) {
    reader.Damaged(start,
                   "the commit has more than " + std::to_string(kMostNormGenerations) + " norm generations");
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

SegmentInfo ReadSegment(ByteReader& reader, int32_t format, Room& room) {
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
  segment.norm_generations = ReadNormGenerations(reader, room);
  segment.compound = ReadCompound(reader);
  if (format <= kWithDeletionCount) segment.deleted_count = reader.ReadInt();
  if (format <= kWithHasPositions) segment.has_positions = reader.ReadByte() == 1;
  if (format <= kWithDiagnostics) SkipStringMap(reader, room);
  return segment;
}

void SkipUserData(ByteReader& reader, int32_t format, Room& room) {
  if (format <= kWithDiagnostics) {
    SkipStringMap(reader, room);
  } else if (format == kWithUserData && reader.ReadByte() != 0) {
    SkipString(reader, room);
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

// Where there is no checksum, the end of the file is all that shows whether its bytes are of this layout.
void CheckEnd(ByteReader& reader, const Commit& commit, bool is_oldest) {
  const uint64_t start = reader.offset();
  // The oldest layout may have its version here. The first one written is 1.
  if (is_oldest && reader.remaining() > 0 && reader.ReadLong() == 0 && commit.segments.empty()) {
    reader.Damaged(start, "version is 0, and there is no segment");
  }
  if (reader.remaining() == 0) return;
  reader.Damaged(reader.offset(), std::to_string(reader.remaining()) + " bytes behind the end of the commit");
}

// The documents of a store that a segment has.
struct Slice {
  std::string_view store;
  int64_t begin;
  int64_t end;
};

// Segments that share documents would have them read once for each.
void CheckSlices(const std::string& file, std::vector<Slice> slices) {
  std::sort(slices.begin(), slices.end(), [](const Slice& a, const Slice& b) {
    return std::tie(a.store, a.begin) < std::tie(b.store, b.begin);
  });
  const auto overlap = std::adjacent_find(slices.begin(), slices.end(), [](const Slice& a, const Slice& b) {
    return a.store == b.store && b.begin < a.end;
  });
  if (overlap == slices.end()) return;
  throw IndexDamagedError(file, 0,
                          "two segments have document " + std::to_string((overlap + 1)->begin) +
                              " of the document store " + std::string(overlap->store));
}

void CheckNumbers(const std::string& file, const SegmentInfo& segment) {
  const auto refuse = [&](const std::string& problem) {
    throw IndexDamagedError(file, 0, "segment " + segment.name + " has " + problem);
  };
  if (segment.store_offset < SegmentInfo::kOwnStore) {
    refuse("its documents at " + std::to_string(segment.store_offset) + " in the document store");
  }
  if (!segment.norm_generations.has_value()) return;
  for (const int64_t generation : *segment.norm_generations) {
    if (generation < SegmentInfo::kNoOwnNorms) refuse("norms of generation " + std::to_string(generation));
  }
}

// What a layout can hold, but no index can mean.
void CheckSense(const std::string& file, const Commit& commit) {
  std::unordered_set<std::string_view> names;
  std::vector<Slice> slices;
  int64_t documents = 0;
  for (const SegmentInfo& segment : commit.segments) {
    CheckNumbers(file, segment);
    if (!names.insert(segment.name).second) {
      throw IndexDamagedError(file, 0, "segment " + segment.name + " is there twice");
    }
    documents += segment.document_count;
    if (segment.store_offset == SegmentInfo::kOwnStore || segment.document_count == 0) continue;
    const int64_t begin = segment.store_offset;
    slices.push_back({segment.store_segment, begin, begin + segment.document_count});
  }
  if (documents > std::numeric_limits<int32_t>::max()) {
    throw IndexDamagedError(file, 0, std::to_string(documents) + " documents are too many");
  }
  CheckSlices(file, std::move(slices));
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
    throw IndexDamagedError(source->name(), 0,
                            std::to_string(source->size()) + " bytes are too many for a commit");
  }
  ByteReader reader(source);
  Commit commit;
  commit.generation = generation;
  const int32_t format = reader.ReadInt();
  if (format < kNewestCommitFormat) {
    reader.Damaged(0, "format is " + std::to_string(format) + ", but " + std::to_string(kNewestCommitFormat) +
                          " is the newest known");
  }
  // Generations in names are younger than format numbers.
  if (format >= 0 && generation > 0) {
    reader.Damaged(0, "format is " + std::to_string(format) +
                          ", but a file with a generation in its name has a negative one");
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
  Room room;
  for (int32_t i = 0; i < count; ++i) commit.segments.push_back(ReadSegment(reader, format, room));
  if (format < 0) SkipUserData(reader, format, room);
  if (format <= kWithChecksum) {
    CheckChecksum(*source, reader, checksum);
  } else {
    CheckEnd(reader, commit, format >= 0);
  }
  commit.end = reader.offset();
  commit.size = reader.size();
  CheckSense(source->name(), commit);
  return commit;
}

void UseNewestCommit(const Folder& folder, const std::function<void(Commit)>& use) {
  // Returns why a commit cannot be used, and nothing where it was.
  const auto try_generation = [&](int64_t generation) -> std::exception_ptr {
    try {
      use(ReadCommit(folder.Open(CommitFileName(generation)), generation));
      return nullptr;
    } catch (const IndexIoError& error) {
      if (!IsAbsenceError(error)) throw;
      return std::current_exception();
    } catch (const IndexError&) {
      return std::current_exception();
    }
  };
  int64_t generation = NewestGeneration(folder);
  if (generation < 0) throw IndexError(folder.path(), "no index in this folder: it holds no segments file");
  for (bool tried_again = false;;) {
    const std::exception_ptr failure = try_generation(generation);
    if (failure == nullptr) return;
    // Where neither can be used, the newer one's failure says more.
    const bool has_older = generation > 1 && folder.Exists(CommitFileName(generation - 1));
    if (has_older && try_generation(generation - 1) == nullptr) return;
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
