#include "commands/shape.h"

#include <algorithm>
#include <utility>

#include "base/text.h"
#include "errors/request_error.h"

namespace quorelasticd {
namespace {

std::string TypeOf(const Json::Value& value) {
  switch (value.type()) {
    case Json::nullValue:
      return "null";
    case Json::intValue:
    case Json::uintValue:
    case Json::realValue:
      return "a number";
    case Json::stringValue:
      return "a string";
    case Json::booleanValue:
      return "a boolean";
    case Json::arrayValue:
      return "an array";
    case Json::objectValue:
      return "an object";
  }
  return "something else";
}

// As the end of "expected ...".
std::string Expected(const Shape& shape) {
  const std::string text = Describe(shape);
  if (shape.kind == Shape::Kind::kBoolean || shape.kind == Shape::Kind::kAny || text.front() == '"')
    return text;
  const bool starts_with_vowel = text.front() == 'a' || text.front() == 'i' || text.front() == 'o';
  return (starts_with_vowel ? "an " : "a ") + text;
}

[[noreturn]] void RefuseValue(const std::string& path, const std::string& problem) {
  throw RequestError(ErrorCode::kBadRequest, path + ": " + problem);
}

[[noreturn]] void RefuseType(const Shape& shape, const Json::Value& value, const std::string& path) {
  RefuseValue(path, "expected " + Expected(shape) + ", found " + TypeOf(value));
}

bool IsOfKind(const Shape& shape, const Json::Value& value) {
  switch (shape.kind) {
    case Shape::Kind::kAny:
      return true;
    case Shape::Kind::kBoolean:
      return value.isBool();
    case Shape::Kind::kInteger:
      return value.isInt64();
    case Shape::Kind::kNumber:
      return value.isNumeric();
    case Shape::Kind::kString:
      return value.isString();
    case Shape::Kind::kArray:
      return value.isArray();
    case Shape::Kind::kObject:
      return value.isObject();
    case Shape::Kind::kEither:
      return std::any_of(shape.of.begin(), shape.of.end(),
                         [&](const Shape& one) { return IsOfKind(one, value); });
  }
  return false;
}

void CheckInteger(const Shape& shape, const Json::Value& value, const std::string& path) {
  const int64_t number = value.asInt64();
  if (number >= shape.least && number <= shape.most) return;
  RefuseValue(path, "expected " + Expected(shape) + ", found " + std::to_string(number));
}

void CheckString(const Shape& shape, const Json::Value& value, const std::string& path) {
  const std::string text = value.asString();
  if (text.empty() && !shape.may_be_empty)
    RefuseValue(path, "expected " + Expected(shape) + ", found an empty one");
  if (static_cast<int64_t>(text.size()) > shape.most) throw LimitExceeded(path, shape.most, "bytes");
  if (!IsValidUtf8(text)) RefuseValue(path, "is no valid Unicode text");
  if (shape.choices.empty()) return;
  if (std::find(shape.choices.begin(), shape.choices.end(), text) != shape.choices.end()) return;
  RefuseValue(path, "expected " + Expected(shape) + ", found " + Quoted(text));
}

void CheckArray(const Shape& shape, const Json::Value& value, const std::string& path) {
  if (value.empty() && !shape.may_be_empty)
    RefuseValue(path, "expected " + Expected(shape) + ", found an empty one");
  if (static_cast<int64_t>(value.size()) > shape.most) throw LimitExceeded(path, shape.most, "elements");
  const Shape& element = shape.of.front();
  if (element.kind == Shape::Kind::kAny) return;
  for (Json::ArrayIndex i = 0; i < value.size(); ++i) {
    CheckShape(element, value[i], path + "[" + std::to_string(i) + "]");
  }
}

std::string MemberNames(const Shape& shape) {
  std::string names;
  for (const Member& member : shape.members) names += (names.empty() ? "" : ", ") + Quoted(member.name);
  return names.empty() ? "none" : names;
}

std::string Inner(const std::string& path, const std::string& name) {
  return path.empty() ? name : path + "." + name;
}

void CheckObject(const Shape& shape, const Json::Value& value, const std::string& path) {
  for (const std::string& name : value.getMemberNames()) {
    const bool is_known = std::any_of(shape.members.begin(), shape.members.end(),
                                      [&](const Member& member) { return member.name == name; });
    if (is_known) continue;
    RefuseValue(path.empty() ? "the request" : path,
                "unknown member " + Quoted(name) + "; expected: " + MemberNames(shape));
  }
  for (const Member& member : shape.members) {
    const std::string inner = Inner(path, member.name);
    const Json::Value* found = value.find(member.name.data(), member.name.data() + member.name.size());
    if (found != nullptr) {
      CheckShape(member.shape, *found, inner);
    } else if (member.is_required) {
      RefuseValue(inner, "missing; expected " + Expected(member.shape));
    }
  }
}

std::string Plural(const Shape& element) {
  switch (element.kind) {
    case Shape::Kind::kString:
      return "array of strings";
    case Shape::Kind::kObject:
      return "array of objects";
    default:
      return "array";
  }
}

std::string DescribeInteger(const Shape& shape) {
  if (shape.most == std::numeric_limits<int64_t>::max()) {
    return "integer of " + std::to_string(shape.least) + " or more";
  }
  return "integer of " + std::to_string(shape.least) + " to " + std::to_string(shape.most);
}

std::string DescribeChoices(const std::vector<std::string>& choices, const std::string& quote) {
  std::string text;
  for (size_t i = 0; i < choices.size(); ++i) {
    if (i > 0) text += i + 1 == choices.size() ? " or " : ", ";
    text += quote + choices[i] + quote;
  }
  return text;
}

Shape OfKind(Shape::Kind kind) {
  Shape shape;
  shape.kind = kind;
  return shape;
}

}  // namespace

Shape Any() { return {}; }

Shape Boolean() { return OfKind(Shape::Kind::kBoolean); }

Shape Integer(int64_t least, int64_t most) {
  Shape shape = OfKind(Shape::Kind::kInteger);
  shape.least = least;
  shape.most = most;
  return shape;
}

Shape Number() { return OfKind(Shape::Kind::kNumber); }

Shape String(int64_t most_bytes) {
  Shape shape = TextUpTo(most_bytes);
  shape.may_be_empty = false;
  return shape;
}

Shape Text() { return OfKind(Shape::Kind::kString); }

Shape TextUpTo(int64_t most_bytes) {
  Shape shape = Text();
  shape.most = most_bytes;
  return shape;
}

Shape Choice(std::vector<std::string> choices) {
  Shape shape = Text();
  shape.choices = std::move(choices);
  return shape;
}

Shape ArrayOf(Shape element, int64_t most) {
  Shape shape = OfKind(Shape::Kind::kArray);
  shape.most = most;
  shape.of.push_back(std::move(element));
  return shape;
}

Shape NonEmptyArrayOf(Shape element, int64_t most) {
  Shape shape = ArrayOf(std::move(element), most);
  shape.may_be_empty = false;
  return shape;
}

Shape Object(std::vector<Member> members) {
  Shape shape = OfKind(Shape::Kind::kObject);
  shape.members = std::move(members);
  return shape;
}

Shape Either(std::vector<Shape> shapes) {
  Shape shape = OfKind(Shape::Kind::kEither);
  shape.of = std::move(shapes);
  return shape;
}

std::string Describe(const Shape& shape) {
  switch (shape.kind) {
    case Shape::Kind::kAny:
      return "any value";
    case Shape::Kind::kBoolean:
      return "true or false";
    case Shape::Kind::kInteger:
      return DescribeInteger(shape);
    case Shape::Kind::kNumber:
      return "number";
    case Shape::Kind::kString:
      return shape.choices.empty() ? "string" : DescribeChoices(shape.choices, "\"");
    case Shape::Kind::kArray:
      return Plural(shape.of.front());
    case Shape::Kind::kObject:
      return "object";
    case Shape::Kind::kEither: {
      std::vector<std::string> words;
      for (const Shape& one : shape.of) words.push_back(Describe(one));
      return DescribeChoices(words, "");
    }
  }
  return "";
}

void CheckShape(const Shape& shape, const Json::Value& value, const std::string& path) {
  if (!IsOfKind(shape, value)) RefuseType(shape, value, path.empty() ? "the request" : path);
  switch (shape.kind) {
    case Shape::Kind::kInteger:
      return CheckInteger(shape, value, path);
    case Shape::Kind::kString:
      return CheckString(shape, value, path);
    case Shape::Kind::kArray:
      return CheckArray(shape, value, path);
    case Shape::Kind::kObject:
      return CheckObject(shape, value, path);
    case Shape::Kind::kEither:
      for (const Shape& one : shape.of) {
        if (IsOfKind(one, value)) return CheckShape(one, value, path);
      }
      return;
    case Shape::Kind::kAny:
    case Shape::Kind::kBoolean:
    case Shape::Kind::kNumber:
      return;
  }
}

}  // namespace quorelasticd
