#pragma once

#include <set>
#include <string>
#include <vector>

namespace quorelastic::testing {

// What the tests read of a manual in docs/man, which is written in mdoc.
struct ManualPage {
  // An entry of a list. Of lists within lists, the inner entries stand for themselves.
  struct Item {
    std::vector<std::string> words;  // of its head, with the macros: "Fl", "-db", "Ar", "folder"
    std::string text;                // of its body, the words of macros included, the macros' names left out

    // The word behind a macro of its head, such as "-db" behind "Fl"; empty where there is none.
    std::string Word(const std::string& macro) const;
  };

  // From one heading to the next, of either level.
  struct Section {
    std::string name;
    std::string above;               // for a heading of the second level, the one of the first; else empty
    std::string paragraph;           // its first paragraph
    std::vector<Item> items;         // of all its lists
    std::set<std::string> options;   // named with Fl, without the dashes
    std::set<std::string> commands;  // named with Cm
    std::vector<std::string> displayed;  // the lines of its literal displays
  };

  std::string text;  // the whole file, with escapes resolved
  std::vector<Section> sections;
  std::set<std::string> references;  // to other manuals, such as "quorelastic.8"

  // Throws std::runtime_error where there is none of the name.
  const Section& Find(const std::string& section) const;

  // What all sections name with Fl, or with Cm.
  std::set<std::string> AllOptions() const;
  std::set<std::string> AllCommands() const;
};

// `name` is the file's, such as "quorelastic.8".
ManualPage ReadManualPage(const std::string& name);

}  // namespace quorelastic::testing
