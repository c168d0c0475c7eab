#pragma once

#include <string>

// Replaces `text` by what standard input holds, line by line, with the newlines dropped and nothing in their
// place. Scripts rely on the rest being as it is, too:
//
//   - a last line without a newline is dropped
//   - a line is cut at its first NUL
//   - a line longer than 1023 characters is the end of reading, but only the end of input ends the function,
//     and input in that state never reaches it: the function does not return
void ReadStdinText(std::string& text);
