#pragma once

#include <string>
#include <string_view>

namespace vantrel::elastic {

// Turns UTF-8 into what the index library takes. Nothing on success; else what is wrong, as the end of a
// sentence about the text. Wrong are malformed UTF-8, of which `out` then holds nothing of use, and the three code
// points that the library's encoder has no bytes for, with the whole text in `out`; handed to it, any of these would
// empty or cut the text without a word.
const char* ToIndexText(std::string_view text, std::wstring& out);

}  // namespace vantrel::elastic
