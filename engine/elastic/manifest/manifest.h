#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/commit/commit.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"

namespace vantrel::elastic::format {

// What the files of a commit are to hold. No structure tells that a norm or a letter became another; this does.
//
// It stands beside the index as text, a line ending with a line feed each:
//
//   quorelastic manifest 1                the version of the layout
//   commit GENERATION                     in base 10
//   file NAME SIZE DIGEST DIGEST ...      for each file of the commit: its bytes in base 10, and for each of its
//                                         blocks (block_digest.h) 16 hexadecimal digits; sorted by NAME
//   digest DIGEST                         of all bytes before this line, as one block; so in every version
//
// The file of the commit itself is among them: a manifest belongs to a commit only if that digest is its own.
struct Manifest {
  struct File {
    std::string name;
    uint64_t size = 0;
    std::vector<uint64_t> digests = {};

    bool operator==(const File&) const = default;
  };

  int64_t generation = 0;
  std::vector<File> files;  // sorted by name

  // Nothing where the commit has no such file.
  const File* Find(std::string_view name) const;

  // Whether this is the manifest of that very commit, whose file is in the folder. Throws IndexError where the file
  // cannot be read.
  bool BelongsTo(const Folder& folder, const Commit& commit) const;

  bool operator==(const Manifest&) const = default;
};

// A name that no file of the index library bears.
inline constexpr const char* kManifestName = "quorelastic.manifest";

// Room for the digests of more than a terabyte. A commit that needs more has no manifest.
inline constexpr uint64_t kLargestManifest = uint64_t{24} << 20;

std::string WriteManifest(const Manifest& manifest);

// Decodes a manifest; nothing where it is whole, but of another version. Throws IndexDamagedError, IndexIoError, and
// IndexError for a file larger than any manifest.
std::optional<Manifest> ReadManifest(const ByteSource& source);

// The manifest that stands beside a commit, where it is whole and belongs to that very commit; else nothing. Throws
// IndexIoError where the system fails.
std::optional<Manifest> FindManifest(const Folder& folder, const Commit& commit);

// The manifest of a commit. What `known` has of its files, which are written once, is taken from there; the others are
// read. Throws IndexError where the system does not let them be.
Manifest MakeManifest(const Folder& folder, const Commit& commit, const std::optional<Manifest>& known = {});

}  // namespace vantrel::elastic::format
