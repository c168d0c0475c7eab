#pragma once

#include <cstddef>
#include <cstdint>

#include "quordaemon/wire.h"

// What the daemon takes at most. An error that a limit causes names it; docs/protocol.md lists them.
namespace quorelasticd {

inline constexpr int64_t kMostJsonDepth = 1000;  // levels of a request, or of a line of a bulk
// Values of a request, or of a line of a bulk: each takes up to 200 bytes of memory, be it two bytes of text.
inline constexpr int64_t kMostJsonValues = 2000000;
inline constexpr int64_t kLongestRequestId = 256;       // bytes
inline constexpr int64_t kMostIndexes = 1000;           // in the data folder
inline constexpr int64_t kMostFields = 1000;            // of one index
inline constexpr int64_t kLongestFieldName = 256;       // bytes
inline constexpr int64_t kMostPreProcessors = 8;        // of one field
inline constexpr int64_t kMostIds = 100000;             // of one document_delete
inline constexpr int64_t kLongestDocumentId = 65536;    // bytes
inline constexpr int64_t kLongestFileName = 4096;       // bytes
inline constexpr int64_t kLongestAnalyzedText = 65536;  // bytes
inline constexpr int64_t kMostTerms = 1000000000;       // of one terms
inline constexpr int64_t kMostHealthRuns = 2;           // checks and repairs at a time
inline constexpr size_t kLongestImportLine = quordaemon::kLongestMessage;

inline constexpr size_t kFailuresReported = 10;  // of one document_bulk; the rest is only counted

}  // namespace quorelasticd
