#pragma once

#include <json/value.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace quorelasticd {

// What can be told of a JSON text before anything is made of it. Of a text that is no JSON it is as good as any.
struct JsonOutline {
  int64_t values = 0;                     // of all levels together
  int64_t depth = 0;                      // how deep brackets nest
  size_t slash = std::string_view::npos;  // the first that is in no string: a comment, or a slip
};
JsonOutline OutlineOf(std::string_view text);

// Makes a value of a JSON text from outside. It must be valid UTF-8, within the limits json_depth and json_values,
// and nothing but one document: refused are comments, a byte order mark, a comma behind the last element, a member twice
// in one object, and anything behind the document. The parser lets control characters in strings pass, and numbers such
// as 01, +1 and 1., though the standard forbids them.
// Throws RequestError: limit_exceeded, or bad_request with a reason that begins with `what`, such as "the request".
Json::Value ParseJson(const std::string& text, const std::string& what);

// An object's text with null for the values of the member `name`: what is left when the rest is too much. The text
// as it is where that cannot be told.
std::string WithoutMember(std::string_view text, std::string_view name);

}  // namespace quorelasticd
