#pragma once

#include <string>
#include <string_view>

namespace vantrel::elastic {

// Turns UTF-8 into what the index library takes. Nothing on success; else what is wrong, as the end of a
// sentence about the text, with `out` undefined. Wrong are malformed UTF-8 and the three code points that the
// library's encoder has no bytes for; handed to it, any of these would empty or cut the text without a word.
const char* ToIndexText(std::string_view text, std::wstring& out);

}  // namespace vantrel::elastic
