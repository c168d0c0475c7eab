#include "elastic/lookup/opening_check.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "elastic/common/quoted.h"
#include "elastic/common/text.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/lookup/term_place.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::lookup {
namespace {

using format::ByteReader;
using format::SegmentInfo;

// Runs the check of a file that the library will read in the same order: where the file ends too early, it will find
// that out itself. Formats newer than it knows, which the checks pass over, it refuses before it reads on.
template <typename Check>
void ReadAlong(Check check) {
  try {
    check();
  } catch (const format::EndOfFileError&) {
  }
}

// What the library, and what goes along, take in memory: a little more than measured.
constexpr uint64_t kPerSegment = uint64_t{28} << 10;
constexpr uint64_t kPerNormGeneration = 64;
constexpr uint64_t kPerName = 640;  // of a field or a sub-file
constexpr uint64_t kPerNameByte = 18;
constexpr uint64_t kPerIndexCharacter = 4;  // of a text in the index over a dictionary

int32_t FirstInt(const std::shared_ptr<const format::ByteSource>& source) {
  return ByteReader(source, sizeof(int32_t)).ReadInt();
}

// The library counts up from what it finds there.
void CheckHint(const std::shared_ptr<const format::ByteSource>& source) {
  constexpr int64_t kNewest = std::numeric_limits<int64_t>::max() / 2;
  ByteReader reader(source, 20);
  reader.ReadInt();
  const int64_t generation = reader.ReadLong();
  if (generation <= kNewest) return;
  reader.Damaged(4, "generation " + std::to_string(generation) + " is too large");
}

}  // namespace

OpeningCheck::OpeningCheck(std::optional<WantedTerm> term) : term_(std::move(term)) {}

OpenedSegment* OpeningCheck::FindSegment(const std::string& name) {
  const auto found = std::find_if(segments_.begin(), segments_.end(),
                                  [&](const auto& segment) { return segment.info.name == name; });
  return found == segments_.end() ? nullptr : &*found;
}

std::vector<OpenedSegment> OpeningCheck::TakeSegments() {
  current_ = nullptr;
  return std::exchange(segments_, {});
}

void OpeningCheck::Check(const std::string& name, const Source& source) {
  if (name == format::kSegmentsGen) return ReadAlong([&] { CheckHint(source); });
  if (const auto generation = format::CommitGeneration(name)) {
    return ReadAlong([&] { CheckCommit(source, *generation); });
  }
  const size_t dot = name.find('.');
  if (dot == std::string::npos) return;
  const std::string extension = name.substr(dot);
  if (extension == ".cfs" || extension == ".fnm") current_ = FindSegment(name.substr(0, dot));
  if (current_ == nullptr) return;
  (format::IsStoreExtension(extension) ? current_->plain_store : current_->plain)[extension] = source;
  if (extension == ".cfs") {
    CheckCompound(source);
  } else if (extension == ".cfx") {
    ReadAlong([&] { CountSubFiles(current_->store_compound.emplace(source)); });
  } else if (extension == ".fnm") {
    ReadAlong([&] { CheckFields(source); });
  } else if (extension == ".tis") {
    ReadAlong([&] { CheckDictionary(source); });
  } else if (extension == ".tii") {
    ReadAlong([&] { CheckTermsIndex(source); });
  } else if (extension == ".del") {
    ReadAlong([&] {
      // A bit for each document, however few are deleted.
      CountMemory(source->name(), static_cast<uint64_t>(current_->info.document_count) / 8);
      current_->deletions = std::make_shared<format::Deletions>(source, current_->info.document_count);
    });
  }
}

void OpeningCheck::CheckCommit(const Source& source, int64_t generation) {
  segments_.clear();
  current_ = nullptr;
  memory_ = index_characters_ = index_bytes_ = 0;
  if (FirstInt(source) < format::kNewestCommitFormat) return;
  format::Commit commit = ReadCommit(source, generation, format::CommitChecksum::kPassOver);
  segments_.reserve(commit.segments.size());
  for (SegmentInfo& segment : commit.segments) {
    const uint64_t norms = segment.norm_generations.has_value() ? segment.norm_generations->size() : 0;
    CountMemory(source->name(), kPerSegment + kPerNormGeneration * norms);
    segments_.push_back({.info = std::move(segment)});
  }
}

// The library opens the files within on its own.
void OpeningCheck::CheckCompound(const Source& source) {
  ReadAlong([&] {
    CountSubFiles(current_->compound.emplace(source));
    if (const Source fields = current_->Core(".fnm")) CheckFields(fields);
    if (const Source dictionary = current_->Core(".tis")) CheckDictionary(dictionary);
    if (const Source index = current_->Core(".tii")) CheckTermsIndex(index);
  });
}

void OpeningCheck::CountSubFiles(const format::CompoundFile& compound) {
  for (const auto& [name, part] : compound.parts()) CountName(compound.source().name(), name);
}

void OpeningCheck::CountName(const std::string& file, const std::string& name) {
  CountMemory(file, kPerName + kPerNameByte * name.size());
}

void OpeningCheck::CountMemory(const std::string& file, uint64_t bytes) {
  memory_ += bytes;
  if (memory_ <= kMostMemory) return;
  throw IndexDamagedError(file, 0,
                          "the index library would take more than " + std::to_string(kMostMemory) +
                              " bytes of memory to open the segments up to this one");
}

// A term's text has but to say how much it shares with the one before; the library keeps each as a whole.
void OpeningCheck::CountIndexText(const format::TermCursor& index) {
  index_characters_ += index.text().size();
  if (index_characters_ <= kFreeIndexCharacters + kMostIndexGrowth * (index_bytes_ + index.offset())) return;
  index.Damaged("the index library would take more than " +
                std::to_string(kPerIndexCharacter * kMostIndexGrowth) +
                " times the size of the files for the texts up to this one");
}

void OpeningCheck::CheckFields(const Source& source) {
  ByteReader start(source, 16);
  if (start.remaining() == 0) return;
  const auto format = static_cast<int32_t>(start.ReadVInt());
  if (format < 0 && format != format::kFieldInfosFormat) return;
  try {
    current_->fields = format::ReadFieldInfos(source);
  } catch (const format::EndOfFileError& error) {
    if (format == format::kFieldInfosFormat) throw;
    // The library would try again as if it were of a still older layout.
    start.Damaged(error.offset(), "the fields go on past the end of the file");
  }
  // Terms of a field whose name the library loses are compared, and end, elsewhere than by the name in the file.
  for (const format::FieldInfo& field : current_->fields) {
    CountName(source->name(), field.name);
    if (!IsKeptText(field.name)) {
      start.Damaged(field.offset, "the index library cannot keep the field name " + Quoted(field.name));
    }
  }
  const auto& generations = current_->info.norm_generations;
  if (!generations.has_value() || generations->size() >= current_->fields.size()) return;
  start.Damaged(0, std::to_string(current_->fields.size()) + " fields, but the commit has norms of " +
                       std::to_string(generations->size()));
}

void OpeningCheck::CheckDictionary(const Source& source) const {
  if (FirstInt(source) < format::TermCursor::kNewestFormat) return;
  format::TermCursor(source, format::TermCursor::File::kDictionary,
                     static_cast<uint32_t>(current_->fields.size()), current_->info.document_count);
}

void OpeningCheck::CheckTermsIndex(const Source& source) {
  if (FirstInt(source) < format::TermCursor::kNewestFormat) return;
  current_->place = FindPlace(source, current_->fields, current_->info.document_count, term_,
                              [this](const format::TermCursor& index) { CountIndexText(index); });
  index_bytes_ += source->size();
}

}  // namespace vantrel::elastic::lookup
