#pragma once

#include <cstdint>
#include <string>

// Prints where the term `field`:`token` stands in the first document numbered `document` or higher that holds
// it. Reports failures and ends normally.
void ShowTermPositions(const std::string& index_path, const std::string& field, const std::string& token,
                       int32_t document);
