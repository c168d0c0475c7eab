#pragma once

#include <string>

// Replaces `text` by what standard input holds up to its end.
void ReadStdinText(std::string& text);
