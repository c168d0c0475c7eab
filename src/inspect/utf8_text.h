#pragma once

#include <string>

#include "vantrel/elastic/library_types.h"

// Appends a wide text of the index library to `out` in UTF-8.
void AppendUtf8(const Lucene::String& text, std::string& out);
