#pragma once

#include <string>
#include <vector>

namespace quorelastic::testing {

// Every match of a POSIX extended pattern in a text, from the first on: the match and its groups, those that took no
// part being empty. (The library's own regular expressions do not compile under the sanitizers.) Throws
// std::invalid_argument for what is no pattern.
std::vector<std::vector<std::string>> FindAll(const std::string& text, const std::string& pattern);

// The lines of a text, without their ends.
std::vector<std::string> SplitLines(const std::string& text);

// Whether a line is as shown, where three dots in what is shown stand for anything.
bool IsAsShown(const std::string& line, const std::string& shown);

}  // namespace quorelastic::testing
