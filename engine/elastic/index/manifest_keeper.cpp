#include "elastic/index/manifest_keeper.h"

#include <exception>
#include <utility>

#include "elastic/common/durable_file.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/io/folder.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

std::optional<format::Manifest> FindNewestManifest(const format::Folder& folder) {
  try {
    return format::FindManifest(folder, format::ReadNewestCommit(folder));
  } catch (const IndexIoError&) {
    throw;
  } catch (const IndexError&) {
    return std::nullopt;  // without a commit to belong to
  }
}

}  // namespace

ManifestKeeper::ManifestKeeper(std::string folder)
    : folder_(std::move(folder)), manifest_(FindNewestManifest(format::DiskFolder(folder_))) {}

bool ManifestKeeper::Update() {
  try {
    return Write();
  } catch (const std::exception&) {
    return false;  // as promised: the commit is none the worse
  }
}

bool ManifestKeeper::Write() {
  const format::DiskFolder folder(folder_);
  const format::Commit commit = format::ReadNewestCommit(folder);
  if (manifest_.has_value() && manifest_->generation == commit.generation) return false;
  format::Manifest next = format::MakeManifest(folder, commit, manifest_);
  const std::string text = format::WriteManifest(next);
  if (text.size() > format::kLargestManifest) return false;
  WriteFileDurably(folder_, format::kManifestName, text);
  manifest_ = std::move(next);
  return true;
}

}  // namespace vantrel::elastic
