#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace vantrel::elastic::format {

// File names of an index. A generation stands in a name in base 36, lower case:
//
//   segments          a commit of generation 0 (the oldest layout)
//   segments_N        a commit of generation N, 1 or more
//   segments.gen      a hint at the newest generation
//   _S.ext            a file of segment _S, where S is a number in base 36
//   _S_N.del          the deleted documents of segment _S, generation N
//   _S_N.sF           the norms of its field number F (in base 10), generation N
inline constexpr std::string_view kSegments = "segments";
inline constexpr std::string_view kSegmentsGen = "segments.gen";

// What a segment may have of its own beside single norms and deletions, and what its document store has, which it may
// share with others.
inline constexpr std::array<std::string_view, 6> kCoreExtensions = {".fnm", ".tis", ".tii",
                                                                    ".frq", ".prx", ".nrm"};
inline constexpr std::array<std::string_view, 5> kStoreExtensions = {".fdx", ".fdt", ".tvx", ".tvd", ".tvf"};

// The generation of a commit's file; nothing when `name` is no such name.
std::optional<int64_t> CommitGeneration(std::string_view name);

std::string CommitFileName(int64_t generation);

// "_" and a number in base 36: what may stand for a segment in a path without leaving the folder.
bool IsSegmentName(std::string_view name);

bool IsCoreExtension(std::string_view extension);
bool IsStoreExtension(std::string_view extension);

// Whether a file has the norms of one field: ".f12" or ".s12".
bool IsNormsExtension(std::string_view extension);

// What a name has from its first dot on; empty without one.
std::string_view ExtensionOf(std::string_view name);

// Which segment a file belongs to, by its name; empty for others.
std::string_view SegmentOfFile(std::string_view name);

// Generation 0 names the file without a generation.
std::string DeletionsFileName(const std::string& segment, int64_t generation);

// A field's own norms, by its number; generation 0 as above.
std::string NormsFileName(const std::string& segment, size_t field, int64_t generation);

}  // namespace vantrel::elastic::format
