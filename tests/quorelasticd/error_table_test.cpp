#include <gtest/gtest.h>

#include <new>
#include <set>
#include <stdexcept>
#include <string>
#include <system_error>

#include "base/text.h"
#include "errors/error_code.h"
#include "errors/request_error.h"
#include "vantrel/elastic/index_error.h"

namespace quorelasticd {
namespace {

using namespace vantrel::elastic;

template <typename Error>
RequestError Translate(const Error& error) {
  try {
    throw error;
  } catch (...) {
    return ToRequestError();
  }
}

TEST(ErrorTable, HasOneEntryForEveryCodeInTheirOrder) {
  ASSERT_EQ(kErrorTable.size(), static_cast<size_t>(ErrorCode::kInternal) + 1);
  std::set<std::string> texts;
  for (size_t i = 0; i < kErrorTable.size(); ++i) {
    EXPECT_EQ(static_cast<size_t>(kErrorTable[i].code), i);
    EXPECT_EQ(ToText(kErrorTable[i].code), kErrorTable[i].text);
    EXPECT_TRUE(texts.insert(kErrorTable[i].text).second) << kErrorTable[i].text;
    EXPECT_NE(std::string(kErrorTable[i].meaning), "");
  }
}

TEST(RequestError, WhatTheEngineThrowsHasACode) {
  EXPECT_EQ(Translate(IndexLockedError("/x")).code(), ErrorCode::kLocked);
  EXPECT_EQ(Translate(IndexExistsError("/x")).code(), ErrorCode::kIndexExists);
  EXPECT_EQ(Translate(IndexIoError("/x", "cannot read", EIO)).code(), ErrorCode::kIoError);
  EXPECT_EQ(Translate(IndexChangesLostError("/x")).code(), ErrorCode::kIoError);
  EXPECT_EQ(Translate(IndexDamagedError("/x", 3, "wrong")).code(), ErrorCode::kCorrupt);
  EXPECT_EQ(Translate(IndexError("/x", "wrong")).code(), ErrorCode::kCorrupt);
  EXPECT_EQ(Translate(IndexValueError("/x", "wrong")).code(), ErrorCode::kBadRequest);
}

TEST(RequestError, WhatAnythingElseThrowsHasACode) {
  EXPECT_EQ(Translate(std::system_error(EIO, std::generic_category())).code(), ErrorCode::kIoError);
  EXPECT_EQ(Translate(std::bad_alloc()).code(), ErrorCode::kInternal);
  EXPECT_EQ(Translate(std::logic_error("oh")).code(), ErrorCode::kInternal);
  EXPECT_EQ(Translate(42).code(), ErrorCode::kInternal);
  EXPECT_EQ(Translate(RequestError(ErrorCode::kTimeout, "late")).code(), ErrorCode::kTimeout);
}

TEST(RequestError, WhatIsWrongWithARequestDoesNotTellWhereTheIndexLies) {
  EXPECT_EQ(Translate(IndexValueError("/secret/x", "no field")).reason(), "no field");
}

TEST(RequestError, TheReasonIsAlwaysOneLineOfUtf8) {
  const RequestError error(ErrorCode::kIoError, "a\nb\xff");
  EXPECT_EQ(error.reason(), "a b\xef\xbf\xbd");
  EXPECT_EQ(error.ToJson()["reason"].asString(), error.reason());
  EXPECT_EQ(error.ToJson()["code"].asString(), "io_error");
}

TEST(RequestError, ALimitIsNamed) {
  const Json::Value json = LimitExceeded("connections", 7, "at a time").ToJson();
  EXPECT_EQ(json["code"].asString(), "limit_exceeded");
  EXPECT_EQ(json["limit"].asString(), "connections");
  EXPECT_EQ(json["most"].asInt64(), 7);
  EXPECT_EQ(json["reason"].asString(), "connections: at most 7 at a time");
}

}  // namespace
}  // namespace quorelasticd
