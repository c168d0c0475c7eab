#pragma once

#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

enum class RepairOutcome {
  kClean,    // the index library's checker found nothing wrong, and nothing was done
  kRepaired  // there is a new commit without the segments that cannot be read
};

// Has the index library's checker look at the newest commit of the index in a folder, and drop the segments that it
// finds bad: all of their documents are lost. The old commit and the files of those segments stay behind. Where the
// commit had a manifest, the new one has, with the digests that are known: what had decayed in a segment that the
// checker keeps is found by a check as before.
//
// The checker crashes on some damages. Segments that CheckIndexHealth calls unsafe are therefore tried first, each by
// the checker in a child process with limits on memory and time. One that the child does not survive counts as bad;
// the checker itself is kept from its files.
//
// Takes the index's write lock before it changes anything. To be called where the process has no other thread: it
// forks. Throws IndexLockedError where somebody has the index open for writing; IndexError and its kinds where there is
// no commit that can be read, or the system fails. Then nothing was changed.
VANTREL_ELASTIC_EXPORT RepairOutcome RepairIndex(const std::string& path);

}  // namespace vantrel::elastic
