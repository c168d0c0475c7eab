#pragma once

#include <string>
#include <string_view>

namespace vantrel::elastic {

// A name from outside as an error message can show it: in quotes, on one line, with every byte that is not part of
// printable text as \xNN. A long name is cut: whatever its bytes, at most 90 bytes are returned.
std::string Quoted(std::string_view name);

}  // namespace vantrel::elastic
