#pragma once

#include <optional>
#include <string>

#include "elastic/manifest/manifest.h"

namespace vantrel::elastic {

// Keeps the manifest beside an index in step with its commits. For who holds the index's write lock, and one thread
// at a time.
class ManifestKeeper {
 public:
  // Takes over the manifest of the newest commit, if there is one: files that it names are not digested again, as
  // the files of an index are written once. So what decays in them meanwhile stays known. Throws
  // IndexIoError where the system fails.
  explicit ManifestKeeper(std::string folder);

  // That of the newest commit, or of the last one that was given one; nothing as long as there is none.
  const std::optional<format::Manifest>& manifest() const { return manifest_; }

  // Gives the newest commit a manifest. Where the system does not let it, the commit stands without one, and a check
  // sees less; what manifest is left then belongs to an earlier commit.
  // Returns whether there is one that was not there before.
  bool Update();

 private:
  bool Write();

  std::string folder_;
  std::optional<format::Manifest> manifest_;
};

}  // namespace vantrel::elastic
