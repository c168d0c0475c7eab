#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// Something in an index that is not as it should be.
struct HealthFinding {
  enum class Grade {
    kDamaged,  // something is lost or wrong
    kUnsafe    // the index library could crash, hang or take gigabytes on it
  };

  std::string file;  // its path, within a compound file with the sub-file in parentheses; or the index folder
  uint64_t offset = 0;  // in the file or sub-file, in bytes
  std::string expected = {};
  std::string found = {};
  Grade grade = Grade::kDamaged;
  std::string segment = {};  // such as "_0"; empty where the whole index is concerned

  bool operator==(const HealthFinding&) const = default;
};

// How far a check has come.
struct HealthProgress {
  size_t segments = 0;         // of the commit
  size_t segments_opened = 0;  // of them, those that are or were under way
  uint64_t bytes_read = 0;
  uint64_t bytes_opened =
      0;  // of the files opened so far; a little more may be read where parts are read twice
};

// How a check goes about it.
struct HealthOptions {
  // How many threads read, the calling one among them; 0: as many as there are processors.
  unsigned threads = 0;

  // Called about every 20 ms while bytes are read, by one thread at a time, which need not be the calling one. An
  // exception that it throws cancels the check and passes on. Whatever the files hold, no more than 100 ms go by
  // between two calls, and from the exception to the end of the check, if the disk delivers 256 KiB in that time.
  std::function<void(const HealthProgress&)> progress = {};
};

// What a check has found.
struct HealthReport {
  // What every commit of an Index leaves beside its files: their sizes and digests.
  enum class Manifest {
    kNone,     // there is none
    kNotUsed,  // it is of another commit or version, or damaged, which is a finding
    kCompared  // every byte of every file was compared with it
  };

  int64_t generation = -1;         // of the commit that was checked; -1 where none could be read
  std::vector<std::string> files;  // that it is made of, and that were there: their paths
  // From the 20,000th on, only those that are unsafe.
  std::vector<HealthFinding> findings;
  Manifest manifest = Manifest::kNone;

  // Whether nothing was found.
  bool clean() const { return findings.empty(); }
};

// Reads every byte of the newest commit of the index in a folder and checks it: that all counts, pointers, orders,
// texts and checksums are in themselves and among each other as the format demands. What no structure tells, such
// as a norm or a letter that became another, is seen where the commit has a manifest, and cannot be seen else.
//
// Nothing is created, locked or changed, and a writer may go on beside it: what is not part of the commit is
// ignored, and where the files of a commit are gone because there is a newer one, that one is checked instead. Takes
// a few MiB for each thread, however large the index. Thread-safe.
//
// A folder that holds no index, or one that cannot be used, is a finding. Throws IndexIoError where there is no such
// folder, or where the system fails (a read error, no more open files), and IndexError where a file shrinks
// meanwhile: then there is no verdict.
VANTREL_ELASTIC_EXPORT HealthReport CheckIndexHealth(const std::string& path,
                                                     const HealthOptions& options = {});

// True when CheckIndexHealth finds anything. Throws what it throws.
VANTREL_ELASTIC_EXPORT bool IsIndexCorrupted(const std::string& path);

}  // namespace vantrel::elastic
