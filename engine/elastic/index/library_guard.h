#pragma once

#include <sys/stat.h>

#include <chrono>
#include <cstdint>
#include <ctime>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>

#include "elastic/format/commit/commit.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"
#include "elastic/index/verified_file.h"
#include "elastic/manifest/manifest.h"
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
// A file that takes another's place under the same name is known no more, or verified anew. Once verified, a block is
// not read again for that: what decays on the disk later is found by who opens the index next.
//
// For any thread.
class LibraryGuard {
 public:
  // Looks at nothing yet.
  explicit LibraryGuard(std::string folder);

  // To be called before the index library opens the newest commit; returns its generation. Throws IndexDamagedError
  // where one of its segments is unsafe, and IndexError where its files cannot be read. May take long, see above.
  int64_t AdmitNewestCommit();

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
  // Which of the files that ever bore a name is meant.
  struct Identity {
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    timespec changed{};

    bool operator==(const Identity& other) const;
  };

  using Identities = std::map<std::string, Identity>;  // by name

  struct KnownFile {
    // Whether the file that bears the name now is this one.
    bool Is(const Identity& file) const;

    std::shared_ptr<FileVerification> verification = std::make_shared<FileVerification>();
    std::optional<Identity> identity = {};  // nothing as long as it has not been opened
    bool is_written_here = false;           // and then it has no identity before it has digests
  };

  // A check of whole segments that found something unsafe.
  struct Refusal {
    std::chrono::steady_clock::time_point until;
    IndexDamagedError error;
  };

  void ForgetFiles();
  void Admit(const format::Folder& folder, const format::Commit& commit);
  bool AdmitByManifest(const format::Folder& folder, const format::Commit& commit);
  void AdmitUnknownSegments(const format::Folder& folder, const format::Commit& commit);
  void CheckSegments(const format::Folder& folder, const format::Commit& commit);
  Identity Identify(const std::string& name) const;
  Identities IdentifyAll(const std::set<std::string>& names) const;
  bool Knows(const Identities& files) const;
  void NoteChecked(const Identities& files);
  void KeepOnly(const Identities& files);
  std::shared_ptr<FileVerification> Find(const std::string& name);

  const std::string folder_;

  std::mutex admission_mutex_;                // for the order of admissions, and what follows
  std::optional<format::Manifest> manifest_;  // of the commit admitted last, if it has one
  int64_t generation_ = 0;                    // of that commit
  std::map<int64_t, Refusal> refusals_;       // by generation

  mutable std::mutex files_mutex_;          // for what follows
  std::map<std::string, KnownFile> files_;  // those that may be handed out, by name
};

}  // namespace vantrel::elastic
