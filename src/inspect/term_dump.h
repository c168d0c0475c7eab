#pragma once

#include <string>

// Prints the term dictionary of every segment of the index at `index_path`: all terms, or the live ones only.
// Reads --info, --field and --max. Catches nothing.
void DumpTermDict(const std::string& index_path, bool live_only);
