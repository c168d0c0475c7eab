#pragma once

#include <string_view>

namespace quorelasticd {

inline constexpr const char* kIndexNameRule =
    "1 to 64 of a-z, 0-9, _ and -, beginning with a letter or a digit, and not \"import\"";

// Whether an index may bear this name. Such a name is one plain component of a path, and no hidden one.
bool IsIndexName(std::string_view name);

}  // namespace quorelasticd
