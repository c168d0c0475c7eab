#pragma once

#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "support/repository.h"
#include "support/tool_run.h"

namespace quorelastic::testing {

// The names of the options that the real tool has, in the order of its table. An empty name is the beginning of all
// of them, so that the parser lists them as what may be meant.
inline std::vector<std::string> ReadOptionTable() {
  const RunResult run = RunTool({"--="});
  const std::string line = run.err.substr(0, run.err.find('\n'));
  std::vector<std::string> names;
  const std::string begin = " '--";
  const size_t list = line.find("possibilities:");
  for (size_t at = list; (at = line.find(begin, at)) != std::string::npos;) {
    at += begin.size();
    names.push_back(line.substr(at, line.find('\'', at) - at));
  }
  if (names.empty()) throw std::runtime_error("the tool does not list its options: " + run.err);
  return names;
}

// Whether it wants a value.
inline bool TakesValue(const std::string& option) {
  return RunTool({"--" + option}).err.find("requires an argument") != std::string::npos;
}

// The action words that it compares with.
inline std::set<std::string> ReadActions() { return FindInSources("src", R"re(\baction == "(\w+)")re"); }

}  // namespace quorelastic::testing
