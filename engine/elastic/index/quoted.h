#pragma once

#include <string>
#include <string_view>

namespace vantrel::elastic {

// A name from outside as an error message can show it: in quotes, on one line, cut where it is long, and with
// every byte that is no part of printable text as \xNN.
std::string Quoted(std::string_view name);

}  // namespace vantrel::elastic
