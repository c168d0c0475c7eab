#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace vantrel::elastic {

// Characters are code points; a byte that is not part of well-formed UTF-8 is one for itself.

// How many bytes the first character of `text` takes, which is not empty.
size_t FirstCharacterLength(std::string_view text);

uint64_t CountCharacters(std::string_view text);

}  // namespace vantrel::elastic
