#pragma once

#include <lucene++/Lucene.h>

#include <string>

// Appends a wide text of the index library to `out` in UTF-8.
void AppendUtf8(const Lucene::String& text, std::string& out);
