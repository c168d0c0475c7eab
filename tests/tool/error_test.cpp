#include "error/error.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <syslog.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <vector>

#include "error/fail_if.h"

namespace {

struct LoggedMessage {
  int priority;
  std::string text;

  friend bool operator==(const LoggedMessage&, const LoggedMessage&) = default;
};

void PrintTo(const LoggedMessage& message, std::ostream* stream) {
  *stream << message.priority << " " << message.text;
}

std::vector<LoggedMessage> log_messages;
int opened_logs = 0;

// As the C library's syslog, whose formatting of %m it shares; it may leave errno changed as well.
void Record(int priority, const char* format, va_list arguments) {
  std::array<char, 1024> text;
// The formats are checked where they are written.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
  vsnprintf(text.data(), text.size(), format, arguments);
#pragma GCC diagnostic pop
  log_messages.push_back({priority, text.data()});
  errno = ENOTCONN;
}

}  // namespace

// In place of the C library's, for the whole program.
extern "C" void syslog(int priority, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  Record(priority, format, arguments);
  va_end(arguments);
}

// What a hardened build calls.
extern "C" void __syslog_chk(int priority, int, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  Record(priority, format, arguments);
  va_end(arguments);
}

extern "C" void openlog(const char*, int, int) { ++opened_logs; }

namespace vantrel {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

std::string ComposedMessage(const Error& error) { return error.std::runtime_error::what(); }

TEST(ErrorTest, ComposesCodeAndReasonButShowsTheReasonAlone) {
  const Error error(Error::kInvalidInput, "index is required.");
  EXPECT_EQ(ComposedMessage(error), "Vantrel error, code=120, reason=[index is required.]");
  EXPECT_STREQ(error.what(), "index is required.");
  EXPECT_EQ(error.code, 120);
  EXPECT_EQ(error.reason, "index is required.");

  const Error unloadable(Error::kUnloadableJson, "Cannot load json: /tmp/x.json");
  EXPECT_EQ(ComposedMessage(unloadable), "Vantrel error, code=504, reason=[Cannot load json: /tmp/x.json]");
  EXPECT_STREQ(unloadable.what(), "Cannot load json: /tmp/x.json");
}

TEST(ErrorTest, LeavesAnEmptyReasonOutOfTheMessage) {
  const Error bare(Error::kUnloadableJson);
  EXPECT_EQ(ComposedMessage(bare), "Vantrel error, code=504");
  EXPECT_STREQ(bare.what(), "");
  EXPECT_EQ(bare.code, 504);
  EXPECT_EQ(bare.reason, "");

  const Error empty(Error::kInvalidInput, "");
  EXPECT_EQ(ComposedMessage(empty), "Vantrel error, code=120");
  EXPECT_STREQ(empty.what(), "");
}

TEST(ErrorTest, WritesANegativeCodeWithItsSign) {
  const Error error(static_cast<Error::ErrorCode>(-7), "below");
  EXPECT_EQ(ComposedMessage(error), "Vantrel error, code=-7, reason=[below]");
}

TEST(ErrorTest, ShowsTheReasonThroughAnyOfItsBases) {
  try {
    throw Error(Error::kInvalidInput, "caught by base");
  } catch (const std::exception& error) {
    EXPECT_STREQ(error.what(), "caught by base");
  }
}

TEST(ErrorTest, KeepsItsReasonWhenCopied) {
  Error copy(Error::kUnloadableJson);
  {
    std::string reason = "a reason too long for a string to hold in place";
    const Error error(Error::kInvalidInput, reason);
    reason.assign("overwritten");
    copy = error;
  }
  EXPECT_STREQ(copy.what(), "a reason too long for a string to hold in place");
  EXPECT_EQ(copy.code, 120);
}

TEST(ErrorTest, IsARuntimeErrorFollowedByCodeAndReason) {
  // Convertible without doubt: public, and no second base brings another.
  static_assert(std::is_convertible_v<Error*, std::runtime_error*>);
  static_assert(std::is_same_v<std::underlying_type_t<Error::ErrorCode>, int>);
  static_assert(sizeof(Error::ErrorCode) == 4);
  static_assert(std::is_same_v<decltype(Error::code), Error::ErrorCode>);
  static_assert(std::is_same_v<decltype(Error::reason), std::string>);

  struct Expected : std::runtime_error {
    using std::runtime_error::runtime_error;
    Error::ErrorCode code;
    std::string reason;
  };
  static_assert(sizeof(Error) == sizeof(Expected));
  const Error error(Error::kInvalidInput, "x");
  const auto address = [](const auto& object) { return reinterpret_cast<const char*>(&object); };
  EXPECT_EQ(address(static_cast<const std::runtime_error&>(error)), address(error));
  EXPECT_EQ(address(error.code), address(error) + sizeof(std::runtime_error));
  EXPECT_GT(address(error.reason), address(error.code));
}

class FailIfTest : public ::testing::Test {
 protected:
  void SetUp() override {
    log_messages.clear();
    opened_logs = 0;
  }
};

constexpr int kCheckLine = __LINE__ + 2;
void RequireText(const std::string& text) {
  FailIf(text.empty() || text == "-", Error::kInvalidInput, "text is required.");
}

std::string ExpectedStart() {
  return "error_test.cpp:" + std::to_string(kCheckLine) + " (" + std::to_string(getpid()) + ", " +
         std::to_string(geteuid()) +
         ") (RequireText) Failed [text.empty() || text == \"-\"], reason: text is required.";
}

TEST_F(FailIfTest, DoesNothingWhereTheConditionIsFalse) {
  errno = ENOENT;
  EXPECT_NO_THROW(RequireText("given"));
  EXPECT_EQ(errno, ENOENT);
  EXPECT_THAT(log_messages, IsEmpty());
}

TEST_F(FailIfTest, LogsThePlaceAndThrows) {
  errno = 0;
  try {
    RequireText("");
    FAIL() << "nothing was thrown";
  } catch (const Error& error) {
    EXPECT_EQ(errno, 0);
    EXPECT_EQ(error.code, Error::kInvalidInput);
    EXPECT_STREQ(error.what(), "text is required.");
    EXPECT_EQ(ComposedMessage(error), "Vantrel error, code=120, reason=[text is required.]");
  }
  EXPECT_THAT(log_messages, ElementsAre(LoggedMessage{LOG_ERR, ExpectedStart()}));
  EXPECT_EQ(opened_logs, 0);
}

TEST_F(FailIfTest, TellsTheErrorThatIsSetAndClearsIt) {
  errno = ENOENT;
  EXPECT_THROW(RequireText("-"), Error);
  EXPECT_EQ(errno, 0);
  EXPECT_THAT(log_messages,
              ElementsAre(LoggedMessage{LOG_ERR, ExpectedStart() + " [err: No such file or directory]"}));
}

TEST_F(FailIfTest, TellsAStaleErrorOnlyOnce) {
  errno = EACCES;
  EXPECT_THROW(RequireText(""), Error);
  EXPECT_THROW(RequireText(""), Error);
  EXPECT_THAT(log_messages, ElementsAre(LoggedMessage{LOG_ERR, ExpectedStart() + " [err: Permission denied]"},
                                        LoggedMessage{LOG_ERR, ExpectedStart()}));
}

TEST_F(FailIfTest, PassesAReasonThatLooksLikeAFormat) {
  errno = 0;
  const auto check = [](bool bad) { FailIf(bad, Error::kInvalidInput, "100% %s %n %m"); };
  EXPECT_THROW(check(true), Error);
  ASSERT_EQ(log_messages.size(), 1U);
  EXPECT_THAT(log_messages[0].text, ::testing::EndsWith("Failed [bad], reason: 100% %s %n %m"));
}

TEST_F(FailIfTest, EvaluatesItsConditionOnceAndIsOneStatement) {
  int evaluations = 0;
  const auto check = [&](bool wanted) {
    if (wanted)
      FailIf(++evaluations > 5, Error::kInvalidInput, "");
    else
      evaluations = -1;
  };
  check(true);
  EXPECT_EQ(evaluations, 1);
  check(false);
  EXPECT_EQ(evaluations, -1);
}

}  // namespace
}  // namespace vantrel
