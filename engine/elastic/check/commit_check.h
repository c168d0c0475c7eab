#pragma once

#include <optional>

#include "elastic/format/commit/commit.h"
#include "elastic/format/io/folder.h"

namespace vantrel::elastic::check {

// The newest commit, as every reader finds it (commit.h). Throws Mismatch, IndexDamagedError and FileMissingError where
// there is none, or one was lost; IndexIoError where the system refuses something.
format::Commit FindCommit(const format::Folder& folder);

// Checks what a commit says in itself, before the files of its segments, beyond what ReadCommit demands. Throws
// Mismatch.
void CheckCommit(const format::Folder& folder, const format::Commit& commit);

}  // namespace vantrel::elastic::check
