#include "elastic/check/segment_check.h"

#include <algorithm>
#include <string_view>

#include "elastic/check/mismatch.h"
#include "elastic/check/terms_check.h"
#include "elastic/check/vectors_check.h"
#include "elastic/common/quoted.h"
#include "elastic/common/text.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/deletions.h"

namespace vantrel::elastic::check {
namespace {

using format::ByteReader;
using format::ByteSource;
using format::FieldInfo;
using format::SegmentInfo;

constexpr std::string_view kNormsHeader = "NRM\xff";
constexpr uint8_t kKnownFlags = 0x7f;

bool HasNorms(const FieldInfo& field) { return field.indexed && !field.omits_norms; }

// Norms are any bytes: they need only be there.
void ReadThrough(const std::shared_ptr<const ByteSource>& source, std::string_view header) {
  ByteReader reader(source, size_t{64} << 10);
  for (const char expected : header) {
    const uint64_t offset = reader.offset();
    const uint8_t found = reader.ReadByte();
    if (found == static_cast<uint8_t>(expected)) continue;
    Refuse(Grade::kDamaged, source->name(), offset, "the letters NRM and a byte 255",
           "a byte " + std::to_string(found));
  }
  while (reader.remaining() > 0) reader.Take(reader.remaining());
}

void RequireSize(const ByteSource& source, uint64_t expected) {
  RequireEqual(Grade::kDamaged, source.name(), std::min(expected, source.size()),
               "norms, bytes in all:", expected, source.size());
}

bool IsKnownPart(std::string_view extension, bool is_store) {
  if (format::IsStoreExtension(extension)) return true;
  if (is_store) return false;
  if (format::IsCoreExtension(extension)) return true;
  return extension.size() > 2 && extension.starts_with(".f") && extension[2] >= '0' && extension[2] <= '9';
}

}  // namespace

SegmentCheck::SegmentCheck(const format::Folder& folder, const SegmentInfo& info, format::SharedFiles& shared)
    : files_(folder, info, shared) {}

void SegmentCheck::ReadFields() { fields_ = format::ReadFieldInfos(files_.Open(".fnm")); }

uint64_t SegmentCheck::NamesMemory() const {
  uint64_t bytes = files_.NamesMemory();
  if (!fields_.has_value()) return bytes;
  for (const FieldInfo& field : *fields_) bytes += sizeof(FieldInfo) + field.name.capacity();
  return bytes;
}

void SegmentCheck::AddPart(std::vector<Part>& parts, std::initializer_list<const char*> extensions,
                           void (SegmentCheck::*check)() const) {
  Part part{files_.info().name, 0, [this, check] { (this->*check)(); }};
  for (const char* extension : extensions) {
    if (files_.Has(extension)) part.size += files_.Open(extension)->size();
  }
  parts.push_back(std::move(part));
}

std::vector<SegmentCheck::Part> SegmentCheck::Parts() {
  std::vector<Part> parts;
  AddPart(parts, {}, &SegmentCheck::CheckCompounds);
  AddPart(parts, {".del"}, &SegmentCheck::CheckDeletions);
  if (!fields_.has_value()) return parts;
  AddPart(parts, {}, &SegmentCheck::CheckFields);
  AddPart(parts, {".nrm"}, &SegmentCheck::CheckNorms);
  // A byte of postings takes longer than one of a text.
  AddPart(parts, {".tis", ".tis", ".frq", ".frq", ".prx", ".prx"}, &SegmentCheck::CheckTerms);
  AddPart(parts, {".fdt"}, &SegmentCheck::CheckStoredFields);
  AddPart(parts, {".tvd", ".tvf", ".tvf"}, &SegmentCheck::CheckVectors);
  return parts;
}

void SegmentCheck::CheckFields() const {
  const std::string& file = files_.Open(".fnm")->name();
  for (const FieldInfo& field : *fields_) {
    if (!IsKeptText(field.name)) {
      Refuse(Grade::kUnsafe, file, field.offset, "a name that the index library keeps", Quoted(field.name));
    }
    const bool vectors_agree = field.has_vectors || !(field.has_vector_positions || field.has_vector_offsets);
    if ((field.flags & ~kKnownFlags) != 0 || !vectors_agree) {
      Refuse(Grade::kDamaged, file, field.offset, "flags of a field that agree", std::to_string(field.flags));
    }
  }
  const SegmentInfo& info = files_.info();
  if (!info.has_positions.has_value() || *info.has_positions == HasPositions()) return;
  Refuse(Grade::kDamaged, file, 0,
         *info.has_positions ? "fields with positions, as the commit says"
                             : "no fields with positions, as the commit says",
         HasPositions() ? "some" : "none");
}

void SegmentCheck::CheckCompounds() const {
  for (const format::WholeSegment::Compound& compound : files_.Compounds()) {
    const std::string& file = compound.file->source().name();
    RequireEqual(Grade::kDamaged, file, compound.file->table_end(), "the first sub-file at",
                 compound.file->table_end(), compound.file->first_offset());
    const bool is_store = file.ends_with(".cfx");
    for (const auto& [name, part] : compound.file->parts()) {
      if (name.starts_with(compound.segment) && IsKnownPart(name.substr(compound.segment.size()), is_store))
        continue;
      Refuse(Grade::kDamaged, file, 0, "only sub-files of segment " + compound.segment, Quoted(name));
    }
  }
}

void SegmentCheck::CheckDeletions() const {
  const SegmentInfo& info = files_.info();
  const auto source = files_.OpenDeletions();
  if (source == nullptr) {
    // Throws: the commit counts some, but leaves it to the folder whether there is a file of them.
    if (info.deleted_count > 0) files_.Open(".del");
    return;
  }
  format::Deletions deletions(source, info.document_count);
  RequireEqual(Grade::kDamaged, source->name(), deletions.end(), "the file to end at", deletions.end(),
               source->size());
  for (int32_t past = info.document_count; past < INT32_MAX && past / 8 == info.document_count / 8; ++past) {
    if (!deletions.Contains(past)) continue;
    Refuse(Grade::kDamaged, source->name(), source->size() - 1,
           "deleted documents below " + std::to_string(info.document_count), std::to_string(past));
  }
  if (info.deleted_count == SegmentInfo::kNotCounted || info.deleted_count == deletions.count()) return;
  Refuse(Grade::kDamaged, source->name(), 0,
         std::to_string(info.deleted_count) + " deleted documents, as the commit says",
         std::to_string(deletions.count()));
}

void SegmentCheck::CheckNorms() const {
  const SegmentInfo& info = files_.info();
  if (info.norm_generations.has_value() && info.norm_generations->size() != fields_->size()) {
    Refuse(Grade::kUnsafe, files_.Open(".fnm")->name(), 0,
           std::to_string(info.norm_generations->size()) + " fields, as the commit has generations of norms",
           std::to_string(fields_->size()));
  }
  const auto documents = static_cast<uint64_t>(info.document_count);
  uint64_t fields_with_norms = 0;
  bool needs_common = false;
  for (size_t number = 0; number < fields_->size(); ++number) {
    if (!HasNorms((*fields_)[number])) continue;
    ++fields_with_norms;
    if (!files_.HasOwnNorms(number) && info.has_norms_file) {
      needs_common = true;
      continue;
    }
    const auto source = files_.OpenNorms(number);
    RequireSize(*source, documents);
    ReadThrough(source, "");
  }
  if (needs_common || files_.Has(".nrm")) CheckCommonNorms(fields_with_norms);
}

void SegmentCheck::CheckCommonNorms(uint64_t fields_with_norms) const {
  const auto source = files_.Open(".nrm");
  RequireSize(*source,
              kNormsHeader.size() + fields_with_norms * static_cast<uint64_t>(files_.info().document_count));
  ReadThrough(source, kNormsHeader);
}

bool SegmentCheck::HasPositions() const {
  return std::any_of(fields_->begin(), fields_->end(),
                     [](const FieldInfo& field) { return field.indexed && !field.omits_frequencies; });
}

void SegmentCheck::CheckTerms() const {
  TermSources sources{files_.Open(".tis"), files_.Open(".tii"), files_.Open(".frq"), nullptr};
  if (HasPositions()) sources.positions = files_.Open(".prx");
  TermsCheck(sources, *fields_, files_.info().document_count).Run();
  if (HasPositions() || !files_.Has(".prx")) return;
  RequireEqual(Grade::kDamaged, files_.Open(".prx")->name(), 0,
               "positions, since no field has any, in bytes:", 0, files_.Open(".prx")->size());
}

StoreSlice SegmentCheck::Slice() const {
  const SegmentInfo& info = files_.info();
  const bool is_shared = info.store_offset != SegmentInfo::kOwnStore;
  return {is_shared ? static_cast<uint64_t>(info.store_offset) : 0,
          static_cast<uint64_t>(info.document_count), is_shared};
}

void SegmentCheck::CheckStoredFields() const {
  StoredFieldsCheck(files_.Open(".fdx"), files_.Open(".fdt"), *fields_, Slice()).Run();
}

void SegmentCheck::CheckVectors() const {
  const bool wants_vectors =
      std::any_of(fields_->begin(), fields_->end(), [](const FieldInfo& f) { return f.has_vectors; });
  const bool has_any = files_.Has(".tvx") || files_.Has(".tvd") || files_.Has(".tvf");
  // Where each document that was to have vectors failed to be written, there are no files.
  if (!has_any) return;
  if (!wants_vectors) {
    // A shared store holds those of other segments.
    if (Slice().is_shared) return;
    Refuse(Grade::kDamaged, files_.Open(".fnm")->name(), 0,
           "a field with term vectors, since there are files of them", "none");
  }
  VectorsCheck({files_.Open(".tvx"), files_.Open(".tvd"), files_.Open(".tvf")}, *fields_, Slice()).Run();
}

}  // namespace vantrel::elastic::check
