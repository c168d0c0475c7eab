#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace quorelasticd {

// Where the first byte that is no part of well-formed UTF-8 stands; npos where all is well. Well-formed are
// shortest forms only, no surrogates, nothing above U+10FFFF.
size_t FindInvalidUtf8(std::string_view text);

// The text with every byte that is no part of well-formed UTF-8 replaced by U+FFFD, and every control character
// by a blank: fit for one line of a JSON reply or a log.
std::string ToOneLine(std::string_view text);

// A name from outside as a message shows it: in quotes, on one line, cut where it is long.
std::string Quoted(std::string_view name);

}  // namespace quorelasticd
