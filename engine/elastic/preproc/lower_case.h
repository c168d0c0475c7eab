#pragma once

#include <string>
#include <string_view>

namespace vantrel::elastic {

// The lower-case letter of a code point by Unicode, one for one and whatever the locale: letters whose lower case
// takes several code points, or hangs on their neighbours, become what Unicode calls their simple mapping.
char32_t LowerCase(char32_t code_point);

// The same of a text in UTF-8. Bytes that are not UTF-8 stay as they are.
std::string LowerCase(std::string_view text);

}  // namespace vantrel::elastic
