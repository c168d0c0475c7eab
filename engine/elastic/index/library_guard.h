#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>

#include "elastic/format/byte_source.h"
#include "elastic/format/commit.h"
#include "elastic/format/folder.h"
#include "elastic/format/manifest.h"
#include "elastic/index/verified_file.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

// Stands between the files of an index and the index library, which takes what it reads on trust and may crash on
// damage. A segment's file is handed out only
//
// - where the manifest of the newest commit tells what it holds, and then verified as it is read; or
// - where this process wrote it, until a manifest knows it; or
// - where the check of index_health.h, run over its segment, has nothing to say that would be unsafe: once, when the
//   commit is first seen. That reads the whole segment, so it is for commits without a manifest.
//
// For any thread.
class LibraryGuard {
 public:
  // Looks at nothing yet.
  explicit LibraryGuard(std::string folder);

  // To be called with a commit that the index library is about to read. Throws IndexDamagedError where one of its
  // segments is unsafe, and IndexError where its files cannot be read. May take long, see above.
  void Admit(const format::Commit& commit);

  // A file for the index library. One of a segment that is not in an admitted commit must be in the newest one, which
  // is admitted then; and a commit's own file must be one that can be decoded. Throws IndexError.
  std::shared_ptr<const format::ByteSource> Open(const std::string& name);

  // This process is about to write a file anew, or has deleted one.
  void NoteWritten(const std::string& name);
  void NoteDeleted(const std::string& name);

  // This process has given the newest commit its manifest.
  void Take(const format::Manifest& manifest);

  // Another index may have come into the folder's place: forgets all files, but for those that a writer of this
  // process has under way.
  void Forget();

 private:
  struct KnownFile {
    std::shared_ptr<FileVerification> verification = std::make_shared<FileVerification>();
    bool is_written_here = false;
  };

  // What came of the last check of whole segments that found something unsafe.
  struct Refusal {
    int64_t generation = 0;
    std::chrono::steady_clock::time_point until;
    IndexDamagedError error = {"", 0, ""};
  };

  void ForgetFiles();
  void AdmitUnknownSegments(const format::Folder& folder, const format::Commit& commit);
  bool Knows(const std::set<std::string>& names) const;
  std::shared_ptr<FileVerification> Find(const std::string& name) const;

  const std::string folder_;

  std::mutex admission_mutex_;                // for the order of admissions, and what follows
  std::optional<format::Manifest> manifest_;  // of the commit admitted last, if it has one
  int64_t generation_ = 0;                    // of that commit
  Refusal refusal_;

  mutable std::mutex files_mutex_;          // for what follows
  std::map<std::string, KnownFile> files_;  // those that may be handed out, by name
};

}  // namespace vantrel::elastic
