#include "support/manual_page.h"

#include <algorithm>
#include <array>
#include <sstream>
#include <stdexcept>
#include <utility>

#include "support/files.h"
#include "support/repository.h"

namespace quorelastic::testing {
namespace {

std::string Unescaped(std::string text) {
  constexpr std::array<std::pair<const char*, const char*>, 5> kEscapes = {
      {{"\\(aq", "'"}, {"\\(dq", "\""}, {"\\&", ""}, {"\\-", "-"}, {"\\e", "\\"}}};
  for (const auto& [escape, meaning] : kEscapes) {
    const std::string what = escape;
    for (size_t at = 0; (at = text.find(what, at)) != std::string::npos;) {
      text.replace(at, what.size(), meaning);
      at += std::string(meaning).size();
    }
  }
  return text;
}

// The words of a macro line, the macro first. Quotes hold a word with blanks together.
std::vector<std::string> Words(const std::string& line) {
  std::vector<std::string> words;
  std::string word;
  bool is_quoted = false;
  bool is_word = false;
  for (const char c : line.substr(1)) {
    if (c == '"') {
      is_quoted = !is_quoted;
      is_word = true;
    } else if (c == ' ' && !is_quoted) {
      if (is_word) words.push_back(Unescaped(word));
      word.clear();
      is_word = false;
    } else {
      word += c;
      is_word = true;
    }
  }
  if (is_word) words.push_back(Unescaped(word));
  return words;
}

bool IsMacro(const std::string& word) {
  static const std::set<std::string> macros = {"Ar", "Cm", "Dv", "Em", "Ev", "Fl", "Fn", "In", "Li",
                                               "No", "Ns", "Pa", "Pq", "Ql", "Sx", "Vt", "Xr"};
  return macros.contains(word);
}

std::string Join(const std::vector<std::string>& words, size_t from) {
  std::string text;
  for (size_t i = from; i < words.size(); ++i) text += (text.empty() ? "" : " ") + words[i];
  return text;
}

class Reader {
 public:
  explicit Reader(const std::string& text) : stream_(text) { page_.text = Unescaped(text); }

  ManualPage Read() {
    while (std::getline(stream_, line_)) {
      if (line_ == ".Ed") {
        is_display_ = false;
      } else if (is_display_) {
        if (!page_.sections.empty()) page_.sections.back().displayed.push_back(Unescaped(line_));
      } else if (line_.starts_with(".")) {
        ReadMacro(Words(line_));
      } else {
        AddText(Unescaped(line_));
      }
    }
    return std::move(page_);
  }

 private:
  void ReadMacro(const std::vector<std::string>& words) {
    const std::string& macro = words.front();
    if (macro == "Sh" || macro == "Ss") return BeginSection(macro == "Ss", Join(words, 1));
    if (page_.sections.empty()) return;
    ManualPage::Section& section = page_.sections.back();
    is_display_ = macro == "Bd";
    if (macro == "It") {
      section.items.push_back({{words.begin() + 1, words.end()}, ""});
      is_item_ = true;
    }
    if (macro == "El") is_item_ = false;
    if (macro == "Pp" || macro == "Bl" || macro == "Bd") is_past_paragraph_ = true;
    for (size_t i = 0; i + 1 < words.size(); ++i) {
      if (words[i] == "Fl") section.options.insert(words[i + 1].substr(1));
      if (words[i] == "Cm") section.commands.insert(words[i + 1]);
      if (words[i] == "Xr" && i + 2 < words.size())
        page_.references.insert(std::string(words[i + 1]).append(".").append(words[i + 2]));
    }
    if (!IsMacro(macro)) return;
    for (const std::string& word : words) {
      if (!IsMacro(word)) AddText(word);
    }
  }

  void BeginSection(bool is_second_level, const std::string& name) {
    if (!is_second_level) above_ = name;
    page_.sections.push_back({});
    page_.sections.back().name = name;
    if (is_second_level) page_.sections.back().above = above_;
    is_item_ = false;
    is_past_paragraph_ = false;
  }

  void AddText(const std::string& text) {
    if (page_.sections.empty()) return;
    ManualPage::Section& section = page_.sections.back();
    if (!is_item_ && is_past_paragraph_) return;
    std::string& target = is_item_ ? section.items.back().text : section.paragraph;
    target += (target.empty() ? "" : " ") + text;
  }

  std::istringstream stream_;
  std::string line_;
  std::string above_;
  bool is_display_ = false;
  bool is_item_ = false;
  bool is_past_paragraph_ = false;
  ManualPage page_;
};

}  // namespace

std::string ManualPage::Item::Word(const std::string& macro) const {
  const auto found = std::find(words.begin(), words.end(), macro);
  return found == words.end() || found + 1 == words.end() ? "" : *(found + 1);
}

const ManualPage::Section& ManualPage::Find(const std::string& section) const {
  for (const Section& candidate : sections) {
    if (candidate.name == section) return candidate;
  }
  throw std::runtime_error("the manual has no section " + section);
}

std::set<std::string> ManualPage::AllOptions() const {
  std::set<std::string> all;
  for (const Section& section : sections) all.insert(section.options.begin(), section.options.end());
  return all;
}

std::set<std::string> ManualPage::AllCommands() const {
  std::set<std::string> all;
  for (const Section& section : sections) all.insert(section.commands.begin(), section.commands.end());
  return all;
}

ManualPage ReadManualPage(const std::string& name) {
  return Reader(ReadFile(RepositoryPath("docs/man/" + name))).Read();
}

}  // namespace quorelastic::testing
