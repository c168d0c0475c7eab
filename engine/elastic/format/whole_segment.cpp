#include "elastic/format/whole_segment.h"

#include <algorithm>
#include <functional>
#include <utility>

#include "elastic/format/file_names.h"
#include "elastic/format/opening_error.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// ".s12" and the like: the letter and a field number.
bool IsNumbered(std::string_view extension, char letter) {
  return extension.size() > 2 && extension[0] == '.' && extension[1] == letter &&
         std::all_of(extension.begin() + 2, extension.end(), [](char c) { return c >= '0' && c <= '9'; });
}

}  // namespace

WholeSegment::Slot WholeSegment::OpenPlain(const Folder& folder, const std::string& name) {
  ++files_tried_;
  try {
    return {folder.Open(name), nullptr};
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
  if (whole.source == nullptr) return;
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
    Slot& slot = slots_[std::string(extension)];
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
  }
}

void WholeSegment::OpenOldNorms(const Folder& folder) {
  if (info_.has_norms_file || (compound_.has_value() && !compound_->file.has_value())) return;
  const std::vector<std::string> names = compound_.has_value() ? compound_->file->Names() : folder.List();
  for (const std::string& name : names) {
    if (!name.starts_with(info_.name)) continue;
    const std::string extension = name.substr(info_.name.size());
    if (!IsNumbered(extension, 'f')) continue;
    slots_[extension] =
        compound_.has_value() ? Slot{compound_->file->Open(name), nullptr} : OpenPlain(folder, name);
  }
}

void WholeSegment::OpenOwnNorms(const Folder& folder) {
  const auto open = [&](size_t field, int64_t generation) {
    slots_[".s" + std::to_string(field)] = OpenPlain(folder, NormsFileName(info_.name, field, generation));
  };
  if (info_.norm_generations.has_value()) {
    for (size_t field = 0; field < info_.norm_generations->size(); ++field) {
      const int64_t generation = (*info_.norm_generations)[field];
      if (generation == SegmentInfo::kNoOwnNorms) continue;
      const bool look = generation == SegmentInfo::kLookForNorms;
      if (!look || folder.Exists(NormsFileName(info_.name, field, generation))) open(field, generation);
    }
  } else if (info_.compound == SegmentInfo::Compound::kLookForFile) {
    for (const std::string& name : folder.List()) {
      if (!name.starts_with(info_.name)) continue;
      const std::string extension = name.substr(info_.name.size());
      if (IsNumbered(extension, 's')) slots_[extension] = OpenPlain(folder, name);
    }
  }
}

WholeSegment::WholeSegment(const Folder& folder, SegmentInfo info)
    : info_(std::move(info)), folder_path_(folder.path()) {
  const std::string compound_name = info_.name + ".cfs";
  const bool is_compound =
      info_.compound == SegmentInfo::Compound::kYes ||
      (info_.compound == SegmentInfo::Compound::kLookForFile && folder.Exists(compound_name));
  if (is_compound) OpenCompound(folder, compound_name, compound_.emplace());
  const CompoundSlot* core = is_compound ? &*compound_ : nullptr;
  OpenParts(folder, info_.name, core, kCoreExtensions);
  OpenOldNorms(folder);
  OpenOwnNorms(folder);

  if (info_.store_offset == SegmentInfo::kOwnStore) {
    OpenParts(folder, info_.name, core, kStoreExtensions);
  } else {
    if (info_.store_is_compound) OpenCompound(folder, info_.store_segment + ".cfx", store_.emplace());
    OpenParts(folder, info_.store_segment, info_.store_is_compound ? &*store_ : nullptr, kStoreExtensions);
  }

  const std::string deletions = DeletionsFileName(info_.name, info_.deletions_generation);
  has_deletions_ = info_.deletions_generation == SegmentInfo::kLookForDeletions
                       ? folder.Exists(deletions)
                       : info_.deletions_generation != SegmentInfo::kNoDeletions;
  if (has_deletions_) slots_[".del"] = OpenPlain(folder, deletions);
}

bool WholeSegment::Has(const std::string& extension) const {
  const auto slot = slots_.find(extension);
  return slot != slots_.end() && slot->second.source != nullptr;
}

std::shared_ptr<const ByteSource> WholeSegment::Open(const std::string& extension) const {
  const auto slot = slots_.find(extension);
  if (slot == slots_.end()) {
    throw FileMissingError(JoinPath(folder_path_, info_.name + extension), "no such file");
  }
  if (slot->second.failure != nullptr) std::rethrow_exception(slot->second.failure);
  return slot->second.source;
}

bool WholeSegment::HasOwnNorms(size_t field) const { return slots_.contains(".s" + std::to_string(field)); }

std::shared_ptr<const ByteSource> WholeSegment::OpenNorms(size_t field) const {
  if (HasOwnNorms(field)) return Open(".s" + std::to_string(field));
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
