#pragma once

#include <exception>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "elastic/format/commit/commit.h"
#include "elastic/format/commit/shared_files.h"
#include "elastic/format/io/byte_source.h"
#include "elastic/format/io/folder.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/format/segment/compound_file.h"

namespace vantrel::elastic::format {

// Every file of a segment, plain, out of a compound file (.cfs), or out of a document store that it shares with
// others (of its own name, plain or as .cfx). What is there is opened at once and stays open, so that a writer may
// delete it; what is missing is told when it is asked for.
//
//   .fnm .tis .tii .frq .prx .nrm .fN       in the segment's compound file, if it has one
//   .fdx .fdt .tvx .tvd .tvf                in its document store, its own being where the files above are
//   .del .sN                                always beside, with their generations in the name
class WholeSegment {
 public:
  // Throws where the system has no room for one more open file, or fails otherwise: whatever is the matter, it is
  // not the index.
  // `shared` is of the same folder, and the same for all segments of the commit; it is not needed afterwards.
  WholeSegment(const Folder& folder, SegmentInfo info, SharedFiles& shared);

  const SegmentInfo& info() const { return info_; }

  // A file by its extension, such as ".tis". Open() throws FileMissingError, and IndexDamagedError where the
  // compound file that should hold it is damaged.
  bool Has(const std::string& extension) const;
  std::shared_ptr<const ByteSource> Open(const std::string& extension) const;

  // The norms of a field: its own file (.sN), or the common one, or, in the older layouts, one for each field (.fN).
  std::shared_ptr<const ByteSource> OpenNorms(size_t field) const;
  bool HasOwnNorms(size_t field) const;

  // Nothing where no documents are deleted.
  std::shared_ptr<const ByteSource> OpenDeletions() const;
  bool HasDeletions() const { return has_deletions_; }

  // The segment's compound files, with the segment whose name their sub-files bear. Throws as Open() does where
  // the commit names one that cannot be used.
  struct Compound {
    std::string segment;
    const CompoundFile* file;
  };
  std::vector<Compound> Compounds() const;

  // The names of its files in the folder, as far as they could be opened.
  const std::set<std::string>& file_names() const { return file_names_; }

  // How many files it holds open, or could not open: one at least.
  size_t files_tried() const { return files_tried_; }

  // About how much memory the names of sub-files take, in bytes.
  uint64_t NamesMemory() const;

 private:
  // A file, or why it cannot be opened; neither where there is none.
  struct Slot {
    std::shared_ptr<const ByteSource> source;
    std::exception_ptr failure;
  };
  struct CompoundSlot {
    std::optional<CompoundFile> file;
    std::exception_ptr failure;
  };

  Slot OpenPlain(const Folder& folder, const std::string& name);
  void OpenCompound(const Folder& folder, const std::string& name, CompoundSlot& slot);
  void OpenStore(const Folder& folder, SharedFiles& shared);
  void OpenParts(const Folder& folder, const std::string& segment, const CompoundSlot* compound,
                 std::span<const std::string_view> extensions);
  void OpenOldNorms(const Folder& folder, SharedFiles& shared);
  void OpenOwnNorms(const Folder& folder, SharedFiles& shared);
  int64_t OwnNormsGeneration(size_t field) const;
  void Keep(const std::string& extension, Slot slot);
  std::string NameOf(const std::string& extension) const;
  FileMissingError Missing(const std::string& name) const;

  SegmentInfo info_;
  std::map<std::string, Slot> slots_;  // by extension; none for a file that is missing
  std::optional<CompoundSlot> compound_;
  std::optional<CompoundSlot> store_;
  bool has_deletions_ = false;
  std::set<std::string> file_names_;
  size_t files_tried_ = 0;
  std::string folder_path_;
};

}  // namespace vantrel::elastic::format
