#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// What a repair has dropped, or would.
struct RepairReport {
  // A segment that goes, with all of its documents.
  struct Loss {
    std::string segment;        // such as "_3"
    uint64_t documents = 0;     // in it that were not deleted
    bool is_condemned = false;  // the checker did not survive looking at it

    bool operator==(const Loss&) const = default;
  };

  int64_t generation = -1;   // of the commit that was looked at
  bool is_clean = true;      // the index library's checker found nothing wrong
  std::vector<Loss> losses;  // in the order of the commit
};

// Has the index library's checker look at the newest commit of the index in a folder, and drop the segments that it
// finds bad: all of their documents are lost. The old commit and the files of those segments stay behind. Where the
// commit had a manifest, the new one has, with the digests that are known: what had decayed in a segment that the
// checker keeps is found by a check as before.
//
// The checker crashes on some damages. Segments that CheckIndexHealth calls unsafe are therefore tried first, each by
// the checker in a child process with limits on memory and time. One that the child does not survive counts as bad;
// the checker itself is kept from its files. Where the checker survives them one by one but not all together, up to 20
// more trials find out which of them count as bad; where 20 do not suffice, more are dropped than necessary.
//
// Takes the index's write lock before it changes anything. To be called where the process has no other thread: it
// forks. Throws IndexLockedError where somebody has the index open for writing; IndexError and its kinds where there is
// no commit that can be read, or the system fails. Then nothing was changed.
VANTREL_ELASTIC_EXPORT RepairReport RepairIndex(const std::string& path);

// What RepairIndex would drop. Nothing is created, locked or changed, and a writer may go on beside it. Forks and throws
// as RepairIndex does; IndexIoError (EBUSY) also where the index changes faster than it can be looked at.
VANTREL_ELASTIC_EXPORT RepairReport PlanRepair(const std::string& path);

}  // namespace vantrel::elastic
