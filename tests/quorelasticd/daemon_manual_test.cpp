// The manual of the daemon says of options and messages what the daemon itself does.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <set>
#include <string>
#include <vector>

#include "options.h"
#include "support/manual_page.h"
#include "support/repository.h"
#include "support/text_search.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::FindAll;
using quorelastic::testing::FindInSources;
using quorelastic::testing::ManualPage;
using quorelastic::testing::ReadManualPage;
using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsSubsetOf;

// An option as --help shows it.
struct ShownOption {
  std::string name;
  bool takes_value = false;
  std::string default_value;
};

std::vector<ShownOption> ReadHelp() {
  std::string text;
  const char* arguments[] = {"quorelasticd", "--help"};
  ParseOptions(2, arguments, text);
  std::vector<ShownOption> options;
  for (const auto& match : FindAll(text, "\n  --([a-z-]+)( [A-Z]+)?( \\(=([^)]*)\\))? ")) {
    options.push_back({match[1], !match[2].empty(), match[4]});
  }
  return options;
}

std::string ManualComplaint(const std::string& name, const std::string& value) {
  const std::string option = "--" + name + "=" + value;
  const char* arguments[] = {"quorelasticd", option.c_str()};
  std::string text;
  try {
    ParseOptions(2, arguments, text);
  } catch (const OptionError& error) {
    return error.what();
  }
  return "";
}

// What is filled in when a message is written is shown as dots.
std::string WithDots(std::string message) {
  for (size_t at = 0; (at = message.find("{}")) != std::string::npos;) message.replace(at, 2, "...");
  return message;
}

class DaemonManual : public ::testing::Test {
 protected:
  bool Has(const std::string& text) const { return page_.text.find(text) != std::string::npos; }

  const ManualPage page_ = ReadManualPage("quorelasticd.8");
  const std::vector<ManualPage::Item>& options_ = page_.Find("OPTIONS").items;
};

TEST_F(DaemonManual, DescribesEachOptionInTheOrderOfTheHelp) {
  const std::vector<ShownOption> shown = ReadHelp();
  ASSERT_EQ(options_.size(), shown.size());
  for (size_t i = 0; i < shown.size(); ++i) {
    EXPECT_EQ(options_[i].Word("Fl"), "-" + shown[i].name);
    EXPECT_EQ(!options_[i].Word("Ar").empty(), shown[i].takes_value) << shown[i].name;
    EXPECT_THAT(options_[i].text, HasSubstr(shown[i].default_value)) << shown[i].name;
  }
}

TEST_F(DaemonManual, SpeaksOfNoOptionThatIsNone) {
  std::set<std::string> known;
  for (const ShownOption& option : ReadHelp()) known.insert(option.name);
  EXPECT_THAT(page_.AllOptions(), IsSubsetOf(known));
}

TEST_F(DaemonManual, TellsTheRangeOfEachNumber) {
  int numbers = 0;
  for (const ManualPage::Item& item : options_) {
    const std::string complaint = ManualComplaint(item.Word("Fl").substr(1), "-1");
    for (const auto& range : FindAll(complaint, "a number from (.*), found")) {
      EXPECT_THAT(item.text, HasSubstr(range.back())) << complaint;
      ++numbers;
    }
  }
  EXPECT_EQ(numbers, 7);
}

TEST_F(DaemonManual, HasEveryMessageOfTheLog) {
  std::set<std::string> messages =
      FindInSources("quorelasticd", R"re(spdlog::(debug|info|warn|error|critical)\("([^"]+)")re");
  EXPECT_THAT(messages, Contains("ended"));
  for (const std::string& message : messages) {
    EXPECT_TRUE(Has(WithDots(message))) << message;
  }
}

TEST_F(DaemonManual, HasWhatKeepsItFromStarting) {
  std::set<std::string> messages =
      FindInSources("quorelasticd/data_root", R"re(runtime_error\([^;]*": ([^"]+)"\);)re");
  messages.merge(FindInSources("quorelasticd/server", R"re(runtime_error\(path \+ ": ([^"]+)"\);)re"));
  messages.merge(FindInSources("quorelasticd/server", R"re(runtime_error\("([^"]+)"\);)re"));
  messages.merge(FindInSources("quorelasticd/server", R"re(Fail\(path, "([^"]+)")re"));
  messages.merge(FindInSources("engine/elastic/search",
                               R"re(PluginLoadError\(path, (std::string\()?"([a-z ]+[a-z]))re"));
  messages.merge(FindInSources("engine/elastic/search", R"re(FailBySystem\(\w+, "([^"]+)")re"));
  EXPECT_THAT(messages, Contains("cannot open the folder"));
  EXPECT_THAT(messages, Contains("exists, and is no socket"));
  EXPECT_THAT(messages, Contains("cannot listen"));
  EXPECT_THAT(messages, Contains("offers no plugin"));
  for (const std::string& message : messages) EXPECT_TRUE(Has(message)) << message;
}

}  // namespace
}  // namespace quorelasticd
