#include "commands/shape.h"

#include <gtest/gtest.h>

#include <string>

#include "errors/request_error.h"
#include "vantrel/elastic/json_value.h"

namespace quorelasticd {
namespace {

// What is said against a JSON text; "" where it is taken.
std::string Complaint(const Shape& shape, const std::string& text,
                      ErrorCode expected = ErrorCode::kBadRequest) {
  vantrel::elastic::JsonValue value;
  if (!value.fromString(text)) return "no JSON: " + text;
  try {
    CheckShape(shape, value, "data");
    return "";
  } catch (const RequestError& error) {
    EXPECT_EQ(error.code(), expected) << text;
    return error.reason();
  }
}

TEST(Shape, ScalarsAreOfTheirType) {
  EXPECT_EQ(Complaint(Text(), R"("x")"), "");
  EXPECT_EQ(Complaint(Text(), R"("")"), "");
  EXPECT_EQ(Complaint(Text(), "5"), "data: expected a string, found a number");
  EXPECT_EQ(Complaint(Text(), "null"), "data: expected a string, found null");
  EXPECT_EQ(Complaint(Boolean(), "true"), "");
  EXPECT_EQ(Complaint(Boolean(), "0"), "data: expected true or false, found a number");
  EXPECT_EQ(Complaint(Number(), "1.5"), "");
  EXPECT_EQ(Complaint(Number(), "\"1\""), "data: expected a number, found a string");
  EXPECT_EQ(Complaint(Any(), "null"), "");
}

TEST(Shape, IntegersAreWholeAndWithinTheirBounds) {
  const Shape shape = Integer(0, 10);
  EXPECT_EQ(Complaint(shape, "0"), "");
  EXPECT_EQ(Complaint(shape, "10"), "");
  EXPECT_EQ(Complaint(shape, "10.0"), "");
  EXPECT_EQ(Complaint(shape, "11"), "data: expected an integer of 0 to 10, found 11");
  EXPECT_EQ(Complaint(shape, "-1"), "data: expected an integer of 0 to 10, found -1");
  EXPECT_EQ(Complaint(shape, "1.5"), "data: expected an integer of 0 to 10, found a number");
  EXPECT_EQ(Complaint(shape, "18446744073709551615"), "data: expected an integer of 0 to 10, found a number");
  EXPECT_EQ(Complaint(shape, "1e300"), "data: expected an integer of 0 to 10, found a number");
}

TEST(Shape, StringsHaveALengthAndAreText) {
  EXPECT_EQ(Complaint(String(3), R"("abc")"), "");
  EXPECT_EQ(Complaint(String(3), R"("")"), "data: expected a string, found an empty one");
  EXPECT_EQ(Complaint(String(3), R"("abcd")", ErrorCode::kLimitExceeded), "data: at most 3 bytes");
  EXPECT_EQ(Complaint(Text(), R"("\udc00")"), "data: is no valid Unicode text");
}

TEST(Shape, AChoiceNamesWhatThereIs) {
  const Shape shape = Choice({"a", "b", "c"});
  EXPECT_EQ(Complaint(shape, R"("b")"), "");
  EXPECT_EQ(Complaint(shape, R"("d")"), R"(data: expected "a", "b" or "c", found "d")");
}

TEST(Shape, ArraysAreCheckedElementByElement) {
  const Shape shape = ArrayOf(Text(), 2);
  EXPECT_EQ(Complaint(shape, R"(["x","y"])"), "");
  EXPECT_EQ(Complaint(shape, R"(["x",5])"), "data[1]: expected a string, found a number");
  EXPECT_EQ(Complaint(shape, R"({})"), "data: expected an array of strings, found an object");
  EXPECT_EQ(Complaint(shape, R"(["","",""])", ErrorCode::kLimitExceeded), "data: at most 2 elements");
}

TEST(Shape, ObjectsTakeTheirMembersAndNoOthers) {
  const Shape shape =
      Object({{"name", true, Text(), ""}, {"inner", false, Object({{"x", true, Boolean(), ""}}), ""}});
  EXPECT_EQ(Complaint(shape, R"({"name":"n"})"), "");
  EXPECT_EQ(Complaint(shape, R"({"name":"n","inner":{"x":true}})"), "");
  EXPECT_EQ(Complaint(shape, R"({})"), "data.name: missing; expected a string");
  EXPECT_EQ(Complaint(shape, R"({"name":null})"), "data.name: expected a string, found null");
  EXPECT_EQ(Complaint(shape, R"({"name":"n","nam":1})"),
            R"(data: unknown member "nam"; expected: "name", "inner")");
  EXPECT_EQ(Complaint(shape, R"({"name":"n","inner":{}})"), "data.inner.x: missing; expected true or false");
  EXPECT_EQ(Complaint(shape, R"([])"), "data: expected an object, found an array");
}

TEST(Shape, EitherTakesWhatOneOfThemTakes) {
  const Shape shape = Either({Text(), Number()});
  EXPECT_EQ(Complaint(shape, "1"), "");
  EXPECT_EQ(Complaint(shape, R"("x")"), "");
  EXPECT_EQ(Complaint(shape, "true"), "data: expected a string or number, found a boolean");
}

}  // namespace
}  // namespace quorelasticd
