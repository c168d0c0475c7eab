// The manual of the protocol says of commands, errors, limits and plugins what the daemon's own tables say.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "commands/command_table.h"
#include "errors/error_code.h"
#include "member_rows.h"
#include "protocol_document.h"
#include "quordaemon/wire.h"
#include "support/manual_page.h"
#include "vantrel/elastic/search_plugin.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::ManualPage;
using quorelastic::testing::ProtocolDocument;
using quorelastic::testing::ReadManualPage;
using quorelastic::testing::ReadProtocolDocument;
using ::testing::HasSubstr;
using ::testing::IsSupersetOf;
using Entry = std::pair<std::string, std::string>;  // what stands in front, and the text

std::vector<Entry> Entries(const ManualPage::Section& section) {
  std::vector<Entry> entries;
  for (const ManualPage::Item& item : section.items) entries.emplace_back(item.Word("Li"), item.text);
  return entries;
}

class ProtocolManual : public ::testing::Test {
 protected:
  const ManualPage page_ = ReadManualPage("quorelastic-protocol.7");
};

TEST_F(ProtocolManual, DescribesEveryCommandAsItIs) {
  for (const Command& command : CommandTable()) {
    const ManualPage::Section& section = page_.Find(command.name);
    EXPECT_EQ(section.paragraph, command.summary);
    std::vector<Entry> members;
    for (const MemberRow& row : MemberRows(command.data)) {
      members.emplace_back(row.name,
                           row.type + (row.is_required ? ", required. " : ", optional. ") + row.meaning);
    }
    EXPECT_EQ(Entries(section), members) << command.name;
  }
}

TEST_F(ProtocolManual, DescribesTheCommandsInTheirOrderAndNoOther) {
  std::vector<std::string> described;
  for (const ManualPage::Section& section : page_.sections) {
    if (section.above == "COMMANDS") described.push_back(section.name);
  }
  std::vector<std::string> commands;
  for (const Command& command : CommandTable()) commands.push_back(command.name);
  EXPECT_EQ(described, commands);
  for (const std::string& name : page_.AllCommands()) EXPECT_NE(FindCommand(name), nullptr) << name;
}

TEST_F(ProtocolManual, ListsEveryErrorCodeAsItIs) {
  std::vector<Entry> codes;
  codes.reserve(kErrorTable.size());
  for (const ErrorEntry& entry : kErrorTable) codes.emplace_back(entry.text, entry.meaning);
  EXPECT_EQ(Entries(page_.Find("ERROR CODES")), codes);
}

// The document's table of limits is held to the daemon's by a test of its own.
TEST_F(ProtocolManual, ListsTheLimitsThatTheDocumentLists) {
  const auto plain = [](std::string text) {
    std::erase(text, '`');
    return text;
  };
  std::vector<Entry> limits;
  const ProtocolDocument document = ReadProtocolDocument();
  for (const std::vector<std::string>& row : document.sections.at("Limits").table) {
    limits.emplace_back(plain(row.at(0)), row.at(1) + " " + plain(row.at(2)));
  }
  EXPECT_EQ(Entries(page_.Find("Limits")), limits);
}

TEST_F(ProtocolManual, ListsTheSearchPluginsThatAreAlwaysThere) {
  std::vector<std::string> described;
  for (const Entry& entry : Entries(page_.Find("SEARCH PLUGINS"))) described.push_back(entry.first);
  std::vector<std::string> plugins;
  for (const auto& plugin : vantrel::elastic::SearchPluginRegistry::BuiltIn().List()) {
    plugins.push_back(plugin->name());
  }
  EXPECT_THAT(described, ::testing::UnorderedElementsAreArray(plugins));
}

TEST_F(ProtocolManual, TellsTheVersionAndTheLongestMessage) {
  EXPECT_THAT(page_.text, HasSubstr(std::string("This is version ") + kProtocolVersion + " of"));
  EXPECT_THAT(page_.text, HasSubstr(std::to_string(quordaemon::kLongestMessage)));
}

TEST_F(ProtocolManual, SpeaksOfNoOptionOfTheDaemonThatIsNone) {
  const ManualPage daemon = ReadManualPage("quorelasticd.8");
  EXPECT_THAT(daemon.AllOptions(), IsSupersetOf(page_.AllOptions()));
}

}  // namespace
}  // namespace quorelasticd
