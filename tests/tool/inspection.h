#pragma once

#include <string>
#include <vector>

#include "support/library_index.h"
#include "support/temporary_folder.h"
#include "support/tool_run.h"

namespace quorelastic::testing {

// A field whose value is one term, and a text with a term vector.
inline LibraryField Keyword(const std::string& name, const std::string& value) {
  return {.name = name, .value = value, .keyword = true};
}
inline LibraryField VectorText(const std::string& name, const std::string& value,
                               LibraryField::Vector vector) {
  return {.name = name, .value = value, .vector = vector};
}

// Runs an action on the index in a folder.
inline RunResult Inspect(const std::string& action, const std::string& folder,
                         const std::vector<std::string>& options = {}, const RunOptions& run = {}) {
  std::vector<std::string> arguments{"-a", action, "-d", folder};
  arguments.insert(arguments.end(), options.begin(), options.end());
  return RunTool(arguments, run);
}

// The lines of a text, each with its end.
inline std::vector<std::string> LinesWithEnds(const std::string& text) {
  std::vector<std::string> lines;
  for (size_t at = 0; at < text.size();) {
    const size_t end = text.find('\n', at);
    lines.push_back(text.substr(at, end == std::string::npos ? end : end + 1 - at));
    at += lines.back().size();
  }
  return lines;
}

// How many lines begin so.
inline size_t CountLines(const std::string& text, const std::string& start) {
  size_t count = 0;
  for (const std::string& line : LinesWithEnds(text)) {
    if (line.starts_with(start)) ++count;
  }
  return count;
}

}  // namespace quorelastic::testing
