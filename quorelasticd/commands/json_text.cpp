#include "commands/json_text.h"

#include <json/reader.h>

#include <algorithm>
#include <memory>

#include "base/limits.h"
#include "base/text.h"
#include "errors/request_error.h"

namespace quorelasticd {
namespace {

constexpr std::string_view kByteOrderMark = "\xef\xbb\xbf";

bool IsBlank(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; }

// Where the string ends that begins at `quote`: behind its closing quote, or at the end of the text.
size_t SkipString(std::string_view text, size_t quote) {
  size_t at = quote + 1;
  while (at < text.size() && text[at] != '"') at += text[at] == '\\' ? size_t{2} : size_t{1};
  return std::min(at + 1, text.size());
}

size_t SkipBlanks(std::string_view text, size_t at) {
  while (at < text.size() && IsBlank(text[at])) ++at;
  return at;
}

// Where the value that begins at `at` ends.
size_t SkipValue(std::string_view text, size_t at) {
  int64_t depth = 0;
  while (at < text.size()) {
    const char c = text[at];
    if (depth == 0 && (c == ',' || c == '}' || c == ']')) break;
    if (c == '[' || c == '{') ++depth;
    if (c == ']' || c == '}') --depth;
    at = c == '"' ? SkipString(text, at) : at + 1;
  }
  return at;
}

// Making this takes longer than a short document; made once, it is only read.
const Json::CharReaderBuilder& Readers() {
  static const Json::CharReaderBuilder builder = [] {
    Json::CharReaderBuilder made;
    made["allowComments"] = false;
    made["collectComments"] = false;
    made["allowTrailingCommas"] = false;
    made["rejectDupKeys"] = true;
    made["failIfExtra"] = true;
    made["stackLimit"] = static_cast<Json::Int>(kMostJsonDepth);
    return made;
  }();
  return builder;
}

// The parser's first complaint on one line: "Line 1, Column 5 Missing ...".
std::string FirstComplaint(const std::string& complaints) {
  constexpr size_t kLongest = 200;
  std::string line = ToOneLine(complaints.substr(0, kLongest));
  line.erase(0, line.find_first_not_of("* "));
  line.erase(line.find_last_not_of(' ') + 1);
  return line;
}

[[noreturn]] void RefuseText(const std::string& reason) {
  throw RequestError(ErrorCode::kBadRequest, reason);
}

void CheckOutline(const JsonOutline& outline, const std::string& what) {
  if (outline.depth > kMostJsonDepth) throw LimitExceeded("json_depth", kMostJsonDepth, "levels");
  if (outline.values > kMostJsonValues) throw LimitExceeded("json_values", kMostJsonValues, "values");
  if (outline.slash == std::string_view::npos) return;
  RefuseText(what + " is no JSON document: a comment, or a stray /, at byte " +
             std::to_string(outline.slash) + " (counted from 0)");
}

}  // namespace

JsonOutline OutlineOf(std::string_view text) {
  JsonOutline outline;
  outline.values = 1;
  int64_t depth = 0;
  for (size_t at = 0; at < text.size();) {
    const char c = text[at];
    if (c == '"') {
      at = SkipString(text, at);
      continue;
    }
    ++at;
    if (c == ',') {
      ++outline.values;
    } else if (c == '[' || c == '{') {
      outline.depth = std::max(outline.depth, ++depth);
      const size_t next = SkipBlanks(text, at);
      if (next < text.size() && text[next] != ']' && text[next] != '}') ++outline.values;
    } else if (c == ']' || c == '}') {
      --depth;
    } else if (c == '/' && outline.slash == std::string_view::npos) {
      outline.slash = at - 1;
    }
  }
  return outline;
}

Json::Value ParseJson(const std::string& text, const std::string& what) {
  if (const size_t at = WellFormedLength(text); at != text.size()) {
    RefuseText(what + " is no valid UTF-8: byte " + std::to_string(at) + " (counted from 0)");
  }
  if (text.starts_with(kByteOrderMark)) {
    RefuseText(what + " is no JSON document: it begins with a byte order mark");
  }
  CheckOutline(OutlineOf(text), what);
  Json::Value root;
  std::string complaints;
  try {
    const std::unique_ptr<Json::CharReader> reader(Readers().newCharReader());
    if (!reader->parse(text.data(), text.data() + text.size(), &root, &complaints)) {
      RefuseText(what + " is no JSON document: " + FirstComplaint(complaints));
    }
  } catch (const Json::Exception& error) {
    RefuseText(what + " is no JSON document: " + error.what());
  }
  // To the parser, a zero byte behind the document is the end of the text, whatever follows.
  if (text.find('\0', static_cast<size_t>(root.getOffsetLimit())) != std::string::npos) {
    RefuseText(what + " is no JSON document: it holds a zero byte");
  }
  return root;
}

std::string WithoutMember(std::string_view text, std::string_view name) {
  std::string rest;
  size_t kept = 0;  // up to where the text is in `rest`
  size_t at = SkipBlanks(text, 0);
  if (at == text.size() || text[at] != '{') return std::string(text);
  do {
    const size_t key = SkipBlanks(text, at + 1);
    if (key == text.size() || text[key] != '"') break;
    const size_t key_end = SkipString(text, key);
    const size_t colon = SkipBlanks(text, key_end);
    if (colon == text.size() || text[colon] != ':') break;
    at = SkipValue(text, colon + 1);
    if (key_end - key != name.size() + 2 || text.substr(key + 1, name.size()) != name) continue;
    rest += text.substr(kept, colon + 1 - kept);
    rest += "null";
    kept = at;
  } while (at < text.size() && text[at] == ',');
  return rest += text.substr(kept);
}

}  // namespace quorelasticd
