// docs/protocol.md says of commands, errors and limits what the daemon's own tables say.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "base/limits.h"
#include "commands/command_table.h"
#include "errors/error_code.h"
#include "member_rows.h"
#include "options.h"
#include "protocol_document.h"
#include "quordaemon/wire.h"
#include "vantrel/elastic/search.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::ProtocolDocument;
using quorelastic::testing::ReadProtocolDocument;
using Row = std::vector<std::string>;

std::string Code(const std::string& text) { return "`" + text + "`"; }

class ProtocolTables : public ::testing::Test {
 protected:
  const ProtocolDocument document_ = ReadProtocolDocument();
};

TEST_F(ProtocolTables, EveryCommandIsDocumentedAsItIs) {
  for (const Command& command : CommandTable()) {
    const auto section = document_.sections.find(Code(command.name));
    ASSERT_NE(section, document_.sections.end()) << command.name;
    EXPECT_EQ(section->second.paragraph, std::vector<std::string>{command.summary});
    std::vector<Row> rows;
    for (const MemberRow& row : MemberRows(command.data)) {
      rows.push_back({Code(row.name), row.type, row.is_required ? "yes" : "no", row.meaning});
    }
    EXPECT_EQ(section->second.table, rows) << command.name;
  }
}

TEST_F(ProtocolTables, NoCommandIsDocumentedThatIsNot) {
  for (const auto& [heading, section] : document_.sections) {
    if (heading.starts_with("`")) {
      EXPECT_NE(FindCommand(heading.substr(1, heading.size() - 2)), nullptr) << heading;
    }
  }
}

TEST_F(ProtocolTables, EveryErrorCodeIsDocumentedAsItIs) {
  std::vector<Row> rows;
  for (const ErrorEntry& entry : kErrorTable) {
    std::string meaning = entry.meaning;
    for (size_t quote = 0; (quote = meaning.find('"', quote)) != std::string::npos;) meaning[quote] = '`';
    rows.push_back({Code(entry.text), meaning});
  }
  EXPECT_EQ(document_.sections.at("Errors").table, rows);
}

TEST_F(ProtocolTables, EveryLimitIsDocumentedAsItIs) {
  const vantrel::elastic::SearchLimits search;
  const auto row = [](const std::string& name, auto most, const std::string& unit) {
    return Row{Code(name), std::to_string(most), unit};
  };
  EXPECT_THAT(
      document_.sections.at("Limits").table,
      ::testing::ElementsAre(
          row("message_bytes", quordaemon::kLongestMessage, "bytes of a request"),
          row("reply_bytes", quordaemon::kLongestMessage, "bytes of a reply"),
          row("json_depth", kMostJsonDepth, "levels of a request"),
          row("json_values", kMostJsonValues, "values of a request"),
          row("connections", Options().max_connections, "at a time; an option of the daemon"),
          row("stored_indexes", kMostIndexes, "in the data folder"),
          row("request_id", kLongestRequestId, "bytes"),
          row("health_runs", kMostHealthRuns, "checks and repairs at a time"),
          row("data.settings.fields", kMostFields, "elements"),
          row("data.settings.fields[N].name", kLongestFieldName, "bytes"),
          row("data.settings.fields[N].pre_processors", kMostPreProcessors, "elements"),
          row("data.file", kLongestFileName, "bytes"), row("data.ids", kMostIds, "elements"),
          row("data.ids[N]", kLongestDocumentId, "bytes"),
          row("data.text", kLongestAnalyzedText, "bytes of a text to analyze"),
          row("data.indice", search.indexes, "elements"), row("data.filters", search.filters, "elements"),
          row("data.load_field", kMostFields, "elements"),
          row("query_bytes", search.query_bytes, "bytes of a query"),
          row("query_depth", search.query_depth, "parentheses within parentheses"),
          row("query_clauses", search.query_clauses,
              "terms looked up, each field of a word without a field counted"),
          row("query_expansions", search.query_expansions,
              "of these, the ones that go through a dictionary, such as patterns"),
          row("pattern_characters", search.pattern_characters, "characters of one pattern"),
          row("near_words", search.near_words, "words of a phrase with a distance"),
          row("window", search.window, "`from` and `size` together"),
          row("filter_values", search.filter_values, "values in one filter"),
          row("result_bytes", search.result_bytes, "bytes of the values of all hits")));
}

TEST_F(ProtocolTables, TheFramingIsDocumentedAsItIs) {
  EXPECT_NE(document_.text.find(std::to_string(quordaemon::kLongestMessage)), std::string::npos);
  EXPECT_NE(document_.text.find(std::string("This is version ") + kProtocolVersion + ";"), std::string::npos);
  EXPECT_EQ(document_.sections.at("Framing").table.front().front(), std::to_string(quordaemon::kHeaderSize));
}

}  // namespace
}  // namespace quorelasticd
