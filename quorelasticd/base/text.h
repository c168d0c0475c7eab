#pragma once

#include <string>
#include <string_view>

#include "elastic/common/quoted.h"
#include "elastic/common/text.h"

namespace quorelasticd {

using vantrel::elastic::IsValidUtf8;
using vantrel::elastic::Quoted;
using vantrel::elastic::WellFormedLength;

// The text with every byte that is not part of well-formed UTF-8 replaced by U+FFFD, and every control character by a
// blank: fit for one line of a JSON reply or a log.
std::string ToOneLine(std::string_view text);

}  // namespace quorelasticd
