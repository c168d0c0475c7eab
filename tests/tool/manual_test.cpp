// The manual of the tool says of options, actions and messages what the tool itself does.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "support/manual_page.h"
#include "support/repository.h"
#include "support/text_search.h"
#include "tool/option_table.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::IsSubsetOf;
using ::testing::Not;
using ::testing::SizeIs;

std::set<std::string> Matches(const std::string& text, const std::string& pattern) {
  std::set<std::string> found;
  for (const auto& match : FindAll(text, pattern)) found.insert(match.back());
  return found;
}

std::set<std::string> Without(std::set<std::string> all, const std::set<std::string>& some) {
  for (const std::string& one : some) all.erase(one);
  return all;
}

class ToolManualTest : public ::testing::Test {
 protected:
  const ManualPage page_ = ReadManualPage("quorelastic.8");
  const ManualPage::Section& usage_section_ = page_.Find("What the usage text says otherwise");
  const std::vector<std::string> option_list_ = ReadOptionTable();
  const std::set<std::string> options_{option_list_.begin(), option_list_.end()};
};

TEST_F(ToolManualTest, DescribesEachOptionInTheOrderOfTheTable) {
  std::vector<std::string> described;
  for (const ManualPage::Item& item : page_.Find("OPTIONS").items) {
    const std::string option = item.Word("Fl").substr(1);
    described.push_back(option);
    EXPECT_EQ(TakesValue(option), !item.Word("Ar").empty()) << option;
    EXPECT_NE(item.text, "") << option;
  }
  EXPECT_EQ(described, option_list_);
}

TEST_F(ToolManualTest, SpeaksOfNoOptionThatIsNone) { EXPECT_THAT(page_.AllOptions(), IsSubsetOf(options_)); }

TEST_F(ToolManualTest, TellsHowTheUsageTextDiffersFromTheOptions) {
  const std::set<std::string> shown = Matches(RunTool({"--help"}).err, R"(--(\w+))");
  std::map<std::string, std::string> corrections;
  for (const ManualPage::Item& item : usage_section_.items) {
    if (item.Word("Li").empty()) continue;  // the table's head
    corrections[item.Word("Li").substr(2)] = item.Word("Fl").substr(1);
  }
  EXPECT_THAT(corrections, Not(IsEmpty()));
  std::set<std::string> accounted_for;
  for (const auto& [wrong, right] : corrections) {
    EXPECT_THAT(shown, Contains(wrong));
    EXPECT_THAT(options_, Not(Contains(wrong)));
    EXPECT_THAT(options_, Contains(right));
    EXPECT_THAT(RunTool({"--" + wrong, "x"}), Rejected('?', HasSubstr("--" + wrong)));
    accounted_for.insert(wrong);
  }
  EXPECT_EQ(Without(shown, options_), accounted_for);
  EXPECT_EQ(Without(options_, shown), usage_section_.options);
}

TEST_F(ToolManualTest, DescribesEachActionAndNoOther) {
  std::set<std::string> described;
  for (const ManualPage::Item& item : page_.Find("DESCRIPTION").items) described.insert(item.Word("Cm"));
  described.erase("");
  EXPECT_THAT(ReadActions(), Not(IsEmpty()));
  EXPECT_EQ(described, ReadActions());
  EXPECT_THAT(page_.AllCommands(), IsSubsetOf(ReadActions()));
}

TEST_F(ToolManualTest, TellsWhichActionsTheUsageTextLacks) {
  const std::string usage = RunTool({"--help"}).err;
  const size_t begin = usage.find("allowed action: ");
  ASSERT_NE(begin, std::string::npos);
  const std::string list = usage.substr(begin + 16, usage.find('\n', begin) - begin - 16);
  EXPECT_EQ(Without(ReadActions(), Matches(list, R"((\w+))")), usage_section_.commands);
}

TEST_F(ToolManualTest, HasEveryMessage) {
  std::set<std::string> messages = FindInSources("src", R"re(\bw?c(out|err) << L?"([^"\\]+)")re");
  messages.merge(FindInSources("src", R"re(\bFailIf\([^;]*, "([^"]+)"\);)re"));
  messages.merge(FindInSources("src", R"re(Error\([^;]*, "([^"]+)")re"));
  messages.merge(FindInSources("src", R"re(\? "([A-Za-z ]+)" : "[A-Za-z ]+"\))re"));
  messages.merge(FindInSources("src", R"re(\? "[A-Za-z ]+" : "([A-Za-z ]+)"\))re"));
  EXPECT_THAT(messages, Contains("Invalid filter data"));
  EXPECT_THAT(messages, Contains("Cannot load json: "));
  EXPECT_THAT(messages, Contains("NOT clean"));
  EXPECT_THAT(messages, Contains("No entry!!"));
  for (const std::string& message : messages) {
    EXPECT_NE(page_.text.find(message), std::string::npos) << message;
  }
}

TEST(ManualsTest, ReferToEachOtherByTheirNames) {
  std::set<std::string> ours;
  for (const auto& entry : std::filesystem::directory_iterator(RepositoryPath("docs/man"))) {
    ours.insert(entry.path().filename().string());
  }
  EXPECT_THAT(ours, SizeIs(4));
  for (const std::string& name : ours) {
    const std::set<std::string> references = ReadManualPage(name).references;
    for (const std::string& reference : references) {
      if (reference.find("quor") != std::string::npos) {
        EXPECT_THAT(ours, Contains(reference)) << name;
      }
    }
    for (const std::string& other : ours) {
      if (other != name) {
        EXPECT_THAT(references, Contains(other)) << name;
      }
    }
  }
}

TEST(LibraryManualTest, NamesEachPublicHeaderAndNoOther) {
  std::set<std::string> headers;
  const std::string folder = RepositoryPath("engine/include");
  for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
    if (entry.is_regular_file()) headers.insert(entry.path().lexically_relative(folder).string());
  }
  std::set<std::string> named;
  for (const ManualPage::Section& section : ReadManualPage("libquorelastic.3").sections) {
    for (const ManualPage::Item& item : section.items) named.insert(item.Word("In"));
  }
  EXPECT_EQ(named, headers);
}

}  // namespace
}  // namespace quorelastic::testing
