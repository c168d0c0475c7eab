#include "elastic/index/manifest_keeper.h"

#include <exception>
#include <utility>

#include "elastic/format/commit.h"
#include "elastic/format/folder.h"
#include "elastic/index/durable_file.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

std::optional<format::Manifest> ReadOwnManifest(const format::Folder& folder) {
  try {
    auto manifest = format::ReadManifest(*folder.Open(format::kManifestName));
    if (manifest.has_value() && manifest->BelongsTo(folder, format::ReadNewestCommit(folder)))
      return manifest;
  } catch (const IndexError&) {
    // None that could be relied on.
  }
  return std::nullopt;
}

}  // namespace

ManifestKeeper::ManifestKeeper(std::string folder)
    : folder_(std::move(folder)), manifest_(ReadOwnManifest(format::DiskFolder(folder_))) {}

void ManifestKeeper::Update() {
  try {
    Write();
  } catch (const std::exception&) {
    // As promised: the commit is none the worse.
  }
}

void ManifestKeeper::Write() {
  const format::DiskFolder folder(folder_);
  const format::Commit commit = format::ReadNewestCommit(folder);
  if (manifest_.has_value() && manifest_->generation == commit.generation) return;
  format::Manifest next;
  next.generation = commit.generation;
  for (const std::string& name : format::FilesOf(folder, commit)) {
    const format::Manifest::File* known = manifest_.has_value() ? manifest_->Find(name) : nullptr;
    next.files.push_back(known != nullptr ? *known : format::DigestFile(folder, name));
  }
  const std::string text = format::WriteManifest(next);
  if (text.size() > format::kLargestManifest) return;
  WriteFileDurably(folder_, format::kManifestName, text);
  manifest_ = std::move(next);
}

}  // namespace vantrel::elastic
