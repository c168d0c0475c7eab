#pragma once

#include <json/value.h>

#include <cstdint>
#include <limits>
#include <string>
#include <vector>

namespace quorelasticd {

struct Member;

// What a JSON value may be. Shapes describe the commands: they check requests, and tell people what is expected.
struct Shape {
  enum class Kind { kAny, kBoolean, kInteger, kNumber, kString, kArray, kObject, kEither };

  Kind kind = Kind::kAny;
  int64_t least = 0;                                   // an integer
  int64_t most = std::numeric_limits<int64_t>::max();  // an integer, a string's bytes, an array's elements
  bool may_be_empty = true;                            // a string, an array
  std::vector<std::string> choices = {};               // a string; empty for any
  std::vector<Shape> of = {};   // an array: its elements, if not any; kEither: what it can be
  std::vector<Member> members;  // an object; no others are taken
};

struct Member {
  std::string name;
  bool is_required = false;
  Shape shape;
  std::string meaning;  // one sentence for people
};

Shape Any();
Shape Boolean();
Shape Integer(int64_t least, int64_t most);
Shape Number();
Shape String(int64_t most_bytes);  // not empty
Shape Text();                      // any string
Shape TextUpTo(int64_t most_bytes);
Shape Choice(std::vector<std::string> choices);
Shape ArrayOf(Shape element, int64_t most);
Shape NonEmptyArrayOf(Shape element, int64_t most);
Shape Object(std::vector<Member> members);
Shape Either(std::vector<Shape> shapes);

// A shape as people read it, such as "array of strings".
std::string Describe(const Shape& shape);

// Throws RequestError where `value` is not of this shape: bad_request, naming the member, what was expected and
// what is there, or limit_exceeded. `path` is what the value is called, such as "data.fields[2]".
void CheckShape(const Shape& shape, const Json::Value& value, const std::string& path);

}  // namespace quorelasticd
