#include "elastic/segment/whole_segment.h"

#include <functional>
#include <utility>

#include "elastic/common/path.h"
#include "elastic/common/quoted.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/segment/segment_files.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// The files of a store and nothing else: whoever shares it reads its table again.
void RequireStore(const CompoundFile& compound, const std::string& store) {
  for (const std::string& name : compound.Names()) {
    if (name.starts_with(store) && IsStoreExtension(name.substr(store.size()))) continue;
    throw IndexDamagedError(compound.source().name(), 0, Quoted(name) + " is no file of a document store");
  }
}

}  // namespace

WholeSegment::Slot WholeSegment::OpenPlain(const Folder& folder, const std::string& name) {
  ++files_tried_;
  // Looked for first: an exception takes ten times as long, and a commit may name very many files that are missing.
  if (!folder.Exists(name)) return {};
  try {
    auto source = folder.Open(name);
    file_names_.insert(name);
    return {std::move(source), nullptr};
  } catch (const IndexIoError& error) {
    if (!IsMissingError(error)) throw;
    return {nullptr, std::make_exception_ptr(AsMissing(error))};
  } catch (const IndexError& error) {
    return {nullptr, std::make_exception_ptr(AsMissing(error))};
  }
}

void WholeSegment::OpenCompound(const Folder& folder, const std::string& name, CompoundSlot& slot) {
  Slot whole = OpenPlain(folder, name);
  slot.failure = whole.failure;
  if (whole.source == nullptr) {
    if (slot.failure == nullptr) slot.failure = std::make_exception_ptr(Missing(name));
    return;
  }
  try {
    slot.file.emplace(std::move(whole.source));
  } catch (const IndexDamagedError&) {
    slot.failure = std::current_exception();
  }
}

void WholeSegment::OpenParts(const Folder& folder, const std::string& segment, const CompoundSlot* compound,
                             std::span<const std::string_view> extensions) {
  for (const std::string_view extension : extensions) {
    const std::string name = segment + std::string(extension);
    Slot slot;
    if (compound == nullptr) {
      slot = OpenPlain(folder, name);
    } else if (!compound->file.has_value()) {
      slot.failure = compound->failure;
    } else if (compound->file->Exists(name)) {
      slot.source = compound->file->Open(name);
    } else {
      slot.failure = std::make_exception_ptr(
          FileMissingError(compound->file->source().name(), "compound file holds no '" + name + "'"));
    }
    Keep(std::string(extension), std::move(slot));
  }
}

void WholeSegment::OpenStore(const Folder& folder, SharedFiles& shared) {
  CompoundSlot& slot = store_.emplace();
  std::exception_ptr& failure = shared.store_failures()[info_.store_segment];
  if (failure == nullptr) {
    OpenCompound(folder, info_.store_segment + ".cfx", slot);
    try {
      if (slot.file.has_value()) RequireStore(*slot.file, info_.store_segment);
      failure = slot.failure;
    } catch (const IndexDamagedError&) {
      failure = std::current_exception();
    }
  }
  if (failure != nullptr) slot = {std::nullopt, failure};
}

void WholeSegment::OpenOldNorms(const Folder& folder, SharedFiles& shared) {
  if (info_.has_norms_file || (compound_.has_value() && !compound_->file.has_value())) return;
  const auto open = [&](const std::string& name) {
    if (!name.starts_with(info_.name + ".f") || !IsNormsExtension(ExtensionOf(name))) return;
    Keep(std::string(ExtensionOf(name)),
         compound_.has_value() ? Slot{compound_->file->Open(name), nullptr} : OpenPlain(folder, name));
  };
  if (compound_.has_value()) {
    for (const std::string& name : compound_->file->Names()) open(name);
  } else {
    for (const std::string& name : shared.NormsOf(info_.name)) open(name);
  }
}

// Looks for them in the listing: a commit may name very many that are not there.
void WholeSegment::OpenOwnNorms(const Folder& folder, SharedFiles& shared) {
  if (info_.norm_generations.has_value()) {
    for (size_t field = 0; field < info_.norm_generations->size(); ++field) {
      const int64_t generation = OwnNormsGeneration(field);
      if (generation == SegmentInfo::kNoOwnNorms) continue;
      const std::string name = NormsFileName(info_.name, field, generation);
      if (shared.HasNorms(name)) Keep(".s" + std::to_string(field), OpenPlain(folder, name));
    }
  } else if (info_.compound == SegmentInfo::Compound::kLookForFile) {
    for (const std::string& name : shared.NormsOf(info_.name)) {
      if (name.starts_with(info_.name + ".s")) Keep(std::string(ExtensionOf(name)), OpenPlain(folder, name));
    }
  }
}

WholeSegment::WholeSegment(const Folder& folder, SegmentInfo info, SharedFiles& shared)
    : info_(std::move(info)), folder_path_(folder.path()) {
  const bool is_compound = IsCompound(folder, info_);
  if (is_compound) OpenCompound(folder, info_.name + ".cfs", compound_.emplace());
  const CompoundSlot* core = is_compound ? &*compound_ : nullptr;
  OpenParts(folder, info_.name, core, kCoreExtensions);
  OpenOldNorms(folder, shared);
  OpenOwnNorms(folder, shared);

  if (info_.store_offset == SegmentInfo::kOwnStore) {
    OpenParts(folder, info_.name, core, kStoreExtensions);
  } else {
    if (info_.store_is_compound) OpenStore(folder, shared);
    OpenParts(folder, info_.store_segment, info_.store_is_compound ? &*store_ : nullptr, kStoreExtensions);
  }

  has_deletions_ = format::HasDeletions(folder, info_);
  if (has_deletions_) Keep(".del", OpenPlain(folder, NameOf(".del")));
}

void WholeSegment::Keep(const std::string& extension, Slot slot) {
  if (slot.source != nullptr || slot.failure != nullptr) slots_[extension] = std::move(slot);
}

// The file's name where it stands in the folder.
std::string WholeSegment::NameOf(const std::string& extension) const {
  if (extension == ".del") return DeletionsFileName(info_.name, info_.deletions_generation);
  const bool is_shared = IsStoreExtension(extension) && info_.store_offset != SegmentInfo::kOwnStore;
  return (is_shared ? info_.store_segment : info_.name) + extension;
}

FileMissingError WholeSegment::Missing(const std::string& name) const {
  return {JoinPath(folder_path_, name), "cannot open file: No such file or directory"};
}

bool WholeSegment::Has(const std::string& extension) const {
  const auto slot = slots_.find(extension);
  return slot != slots_.end() && slot->second.source != nullptr;
}

std::shared_ptr<const ByteSource> WholeSegment::Open(const std::string& extension) const {
  const auto slot = slots_.find(extension);
  if (slot == slots_.end()) throw Missing(NameOf(extension));
  if (slot->second.failure != nullptr) std::rethrow_exception(slot->second.failure);
  return slot->second.source;
}

int64_t WholeSegment::OwnNormsGeneration(size_t field) const {
  const auto& generations = info_.norm_generations;
  return generations.has_value() && field < generations->size() ? (*generations)[field]
                                                                : SegmentInfo::kNoOwnNorms;
}

// The commit may name a file that is not there.
bool WholeSegment::HasOwnNorms(size_t field) const {
  return slots_.contains(".s" + std::to_string(field)) ||
         OwnNormsGeneration(field) > SegmentInfo::kLookForNorms;
}

std::shared_ptr<const ByteSource> WholeSegment::OpenNorms(size_t field) const {
  const std::string own = ".s" + std::to_string(field);
  if (slots_.contains(own)) return Open(own);
  const int64_t generation = OwnNormsGeneration(field);
  if (generation > SegmentInfo::kLookForNorms) {
    throw Missing(NormsFileName(info_.name, field, generation));
  }
  return Open(info_.has_norms_file ? std::string(".nrm") : ".f" + std::to_string(field));
}

std::shared_ptr<const ByteSource> WholeSegment::OpenDeletions() const {
  return has_deletions_ ? Open(".del") : nullptr;
}

uint64_t WholeSegment::NamesMemory() const {
  constexpr uint64_t kPerSlot = 512;  // with the view of a sub-file
  constexpr uint64_t kPerSubFile = 128;
  uint64_t bytes = slots_.size() * kPerSlot;
  for (const auto& slot : {std::cref(compound_), std::cref(store_)}) {
    const std::optional<CompoundSlot>& compound = slot.get();
    if (!compound.has_value() || !compound->file.has_value()) continue;
    bytes += compound->file->table_end() + compound->file->parts().size() * kPerSubFile;
  }
  return bytes;
}

std::vector<WholeSegment::Compound> WholeSegment::Compounds() const {
  std::vector<Compound> compounds;
  const auto add = [&](const std::string& segment, const std::optional<CompoundSlot>& slot) {
    if (!slot.has_value()) return;
    if (slot->failure != nullptr) std::rethrow_exception(slot->failure);
    compounds.push_back({segment, &*slot->file});
  };
  add(info_.name, compound_);
  add(info_.store_segment, store_);
  return compounds;
}

}  // namespace vantrel::elastic::format
