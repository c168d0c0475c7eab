#pragma once

#include <string>

// Prints completions of a prefix in a field of an index, best first, one a line. An index name without a slash is
// one of the daemon's. Reports failures and ends normally.
void ShowSuggestions(const std::string& index_name, const std::string& field, const std::string& prefix);
