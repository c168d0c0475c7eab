#pragma once

#include <cstdint>
#include <string>

// Prints the terms of one document's term vector for a field, in their stored order. Reports failures and
// ends normally.
void ShowDocTerms(const std::string& index_path, const std::string& field, int32_t document);
