#include "support/text_search.h"

#include <regex.h>

#include <array>
#include <sstream>
#include <stdexcept>
#include <string_view>

namespace quorelastic::testing {
namespace {

class Pattern {
 public:
  explicit Pattern(const std::string& text) {
    if (regcomp(&compiled_, text.c_str(), REG_EXTENDED) != 0)
      throw std::invalid_argument("no pattern: " + text);
  }
  Pattern(const Pattern&) = delete;
  Pattern& operator=(const Pattern&) = delete;
  ~Pattern() { regfree(&compiled_); }

  // The first match at or behind `from`, groups and all; empty where there is none. Sets `from` behind it.
  std::vector<std::string> Next(const std::string& text, size_t& from) const {
    std::array<regmatch_t, 8> places{};
    const std::string rest = text.substr(from);
    if (regexec(&compiled_, rest.c_str(), places.size(), places.data(), 0) != 0) return {};
    std::vector<std::string> match;
    for (size_t i = 0; i <= compiled_.re_nsub; ++i) {
      const regmatch_t& place = places.at(i);
      const auto length = static_cast<size_t>(place.rm_eo - place.rm_so);
      match.push_back(place.rm_so < 0 ? "" : rest.substr(static_cast<size_t>(place.rm_so), length));
    }
    from += static_cast<size_t>(places[0].rm_eo);
    return match;
  }

 private:
  regex_t compiled_{};
};

}  // namespace

std::vector<std::vector<std::string>> FindAll(const std::string& text, const std::string& pattern) {
  const Pattern compiled(pattern);
  std::vector<std::vector<std::string>> found;
  for (size_t from = 0; from < text.size();) {
    std::vector<std::string> match = compiled.Next(text, from);
    if (match.empty() || match.front().empty()) break;
    found.push_back(std::move(match));
  }
  return found;
}

std::vector<std::string> SplitLines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  return lines;
}

bool IsAsShown(const std::string& line, const std::string& shown) {
  constexpr std::string_view kAnything = "...";
  size_t at = 0;
  size_t begin = 0;
  for (bool is_first = true;; is_first = false) {
    const size_t end = shown.find(kAnything, begin);
    const std::string part = shown.substr(begin, end == std::string::npos ? end : end - begin);
    if (end == std::string::npos && !is_first) {
      return line.size() >= at + part.size() && line.ends_with(part);
    }
    if (end == std::string::npos) return line == part;
    const size_t found = is_first ? (line.starts_with(part) ? 0 : std::string::npos) : line.find(part, at);
    if (found == std::string::npos) return false;
    at = found + part.size();
    begin = end + kAnything.size();
  }
}

}  // namespace quorelastic::testing
