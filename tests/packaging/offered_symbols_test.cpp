// What the shared libraries offer to the linker: the classes and functions that their public headers mark.

#include <gmock/gmock.h>

#include <filesystem>
#include <ostream>
#include <regex>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "packaging/command_output.h"
#include "support/files.h"
#include "support/text_search.h"

namespace quorelastic::testing {
namespace {

using ::testing::Contains;
using ::testing::IsEmpty;

// The names of the defined dynamic symbols, demangled; a class's type information counts as the class.
std::vector<std::string> OfferedNames(const std::string& library) {
  static const std::regex line("[0-9a-f]* ([A-Za-z]) (?:(?:typeinfo name|typeinfo|vtable) for )?(.*)");
  std::vector<std::string> names;
  const std::string path = std::string(BUILD_FOLDER) + "/lib/" + library;
  for (const std::string& text : SplitLines(OutputOf(
           {"nm", "--dynamic", "--defined-only", "--demangle", "--without-symbol-versions", path}))) {
    std::smatch parts;
    if (!std::regex_match(text, parts, line)) {
      ADD_FAILURE() << text;
    } else if (parts[1] != "A") {  // the name of a version
      names.push_back(parts[2]);
    }
  }
  return names;
}

// The classes and functions that the headers in a folder mark with a macro.
std::set<std::string> MarkedNames(const std::string& folder, const std::string& macro) {
  const std::regex marked_class("(?:class|struct) " + macro + " (\\w+)");
  const std::regex marked_function(macro + "\\s[^;{(]*?(\\w+)\\(");
  std::set<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    const std::string text = ReadFile(entry.path().string());
    for (const auto& pattern : {marked_class, marked_function}) {
      for (std::sregex_iterator found(text.begin(), text.end(), pattern), end; found != end; ++found) {
        names.insert((*found)[1]);
      }
    }
  }
  return names;
}

struct Library {
  const char* file;
  const char* space;  // the namespace of its names
  const char* headers;
  const char* macro;
  const char* example;  // something that it must offer
};

// What a failed expectation, and the list of tests, show.
std::ostream& operator<<(std::ostream& stream, const Library& library) { return stream << library.file; }

class OfferedSymbols : public ::testing::TestWithParam<Library> {};

TEST_P(OfferedSymbols, AreTheLibrarysOwnAndMarkedInItsHeaders) {
  const Library& library = GetParam();
  const auto marked =
      MarkedNames(std::string(SOURCE_FOLDER) + "/engine/include/" + library.headers, library.macro);
  const std::string space = std::string(library.space) + "::";
  std::vector<std::string> foreign;
  std::vector<std::string> unmarked;
  const std::vector<std::string> names = OfferedNames(library.file);
  for (const std::string& name : names) {
    if (!name.starts_with(space)) {
      foreign.push_back(name);
      continue;
    }
    const std::string rest = name.substr(space.size());
    if (!marked.contains(rest.substr(0, rest.find_first_of(":(["))) && name != library.space)
      unmarked.push_back(name);
  }
  EXPECT_THAT(foreign, IsEmpty());
  EXPECT_THAT(unmarked, IsEmpty());
  EXPECT_THAT(names, Contains(library.example));
}

INSTANTIATE_TEST_SUITE_P(
    Libraries, OfferedSymbols,
    ::testing::Values(Library{"libquorelastic.so", "vantrel::elastic", "vantrel/elastic",
                              "VANTREL_ELASTIC_EXPORT", "vantrel::elastic::IndexIoError"},
                      Library{"libquordaemon.so", "quordaemon", "quordaemon", "QUORDAEMON_EXPORT",
                              "quordaemon::DomainSockConnection::Connect()"}),
    [](const auto& file) { return std::string(file.param.space).substr(0, 3); });

}  // namespace
}  // namespace quorelastic::testing
