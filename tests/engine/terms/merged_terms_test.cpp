#include "elastic/terms/merged_terms.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <ctime>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "support/byte_writer.h"
#include "support/memory_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::SourceOf;

using Term = std::pair<std::string, std::string>;  // field, text

// A segment that holds these terms, which are in order; each term is in as many documents as its text has bytes, and one.
std::unique_ptr<SelectedTerms> Segment(const std::vector<std::string>& fields, const std::vector<Term>& terms,
                                       const format::TermSelection& selection, bool shares_all = true) {
  ByteWriter names = ByteWriter().VInt(-2).VInt(static_cast<int64_t>(fields.size()));
  for (const std::string& name : fields) names.String(name).Byte(1);
  ByteWriter out =
      ByteWriter().Int(-4).Long(static_cast<int64_t>(terms.size())).Int(1 << 20).Int(1 << 20).Int(1);
  const uint64_t first = out.size();
  std::string before;
  size_t documents = 0;
  for (const auto& [field, text] : terms) {
    const auto mismatch = std::mismatch(before.begin(), before.end(), text.begin(), text.end());
    auto shared = static_cast<size_t>(mismatch.first - before.begin());
    if (!shares_all) shared /= 2;  // a writer need not use all of it
    const auto number = std::find(fields.begin(), fields.end(), field) - fields.begin();
    out.VInt(static_cast<int64_t>(shared)).String(text.substr(shared)).VInt(number);
    out.VInt(static_cast<int64_t>(text.size() + 1)).VLong(documents).VLong(0);
    documents = text.size() + 1;
    before = text;
  }
  ByteWriter index = ByteWriter().Int(-4).Long(terms.empty() ? 0 : 1).Int(1 << 20).Int(1 << 20).Int(1);
  if (!terms.empty()) index.VInt(0).VInt(0).VInt(-1).VInt(0).VLong(0).VLong(0).VLong(first);
  format::SegmentFiles files;
  files.info.document_count = 1 << 20;
  files.field_infos = SourceOf(names.bytes());
  files.terms = SourceOf(out.bytes());
  files.terms_index = SourceOf(index.bytes());
  return std::make_unique<SelectedTerms>(std::move(files), selection);
}

std::string RandomText(std::mt19937& random) {
  static const std::vector<std::string> kPieces = {"a",        "b",        "\xc3\xa4",         "\xc3\xb6",
                                                   "\xe4\xb8", "\xf0\x9f", "aaaaaaaaaaaaaaaa", ""};
  std::string text;
  for (auto left = random() % 6; left > 0; --left) {
    const std::string& piece = kPieces[random() % kPieces.size()];
    text += piece;
    if (piece == "\xe4\xb8") text += random() % 2 == 0 ? "\xad" : "\xae";
    if (piece == "\xf0\x9f") text += random() % 2 == 0 ? "\x98\x80" : "\x99\x80";
  }
  return text;
}

TEST(MergedTermsTest, AreTheTermsOfAllSegmentsInOrderEachOnce) {
  std::mt19937 random(3);
  for (int round = 0; round < 300; ++round) {
    const bool has_field = round % 2 == 0;
    format::TermSelection selection;
    if (has_field) selection.field = "f";
    if (round % 3 == 0) selection.text = "a";
    std::map<Term, uint64_t> expected;
    std::vector<std::unique_ptr<SelectedTerms>> segments;
    for (auto left = random() % 9; left > 0; --left) {
      std::vector<std::string> fields = {"f", "abc", "z"};
      std::shuffle(fields.begin(), fields.end(), random);
      std::set<Term> terms;
      for (auto i = random() % 40; i > 0; --i) terms.insert({fields[random() % 3], RandomText(random)});
      for (const Term& term : terms) {
        if ((has_field && term.first != "f") || !term.second.starts_with(selection.text)) continue;
        expected[term] += term.second.size() + 1;
      }
      segments.push_back(Segment(fields, {terms.begin(), terms.end()}, selection, random() % 2 == 0));
    }
    MergedTerms merged(std::move(segments));
    std::vector<std::pair<Term, uint64_t>> found;
    while (merged.Next()) {
      EXPECT_TRUE(merged.IsLive());
      found.push_back({{merged.field(), merged.text()}, merged.document_frequency()});
    }
    EXPECT_EQ(found, (std::vector<std::pair<Term, uint64_t>>(expected.begin(), expected.end())));
    EXPECT_FALSE(merged.Next());
  }
}

TEST(MergedTermsTest, SaysHowMuchATermSharesWithTheOneBefore) {
  const format::TermSelection selection = {.field = "f"};
  std::vector<std::unique_ptr<SelectedTerms>> segments;
  segments.push_back(Segment({"f"}, {{"f", "abc"}, {"f", "abd"}, {"f", "b"}}, selection));
  segments.push_back(Segment({"f"}, {{"f", "abcd"}, {"f", "abd"}}, selection));
  MergedTerms merged(std::move(segments));
  std::vector<std::pair<std::string, size_t>> found;
  while (merged.Next()) found.emplace_back(merged.text(), merged.same_length());
  EXPECT_EQ(found,
            (std::vector<std::pair<std::string, size_t>>{{"abc", 0}, {"abcd", 3}, {"abd", 2}, {"b", 0}}));
}

// Six hundred thousand terms that share 60,000 bytes each: any pass over the whole of a text would take minutes.
TEST(MergedTermsTest, LongTextsThatTermsShareAreNotComparedAgain) {
  const std::string shared(60'000, 'x');
  const auto add = [](ByteWriter& out, int number, bool is_first, const std::string& beginning) {
    const std::string text = {static_cast<char>('!' + number / 8100),
                              static_cast<char>('!' + number / 90 % 90),
                              static_cast<char>('!' + number % 90)};
    out.VInt(is_first ? 0 : 60'000).String(is_first ? beginning + text : text);
    out.VInt(0).VInt(1).VLong(is_first ? 0 : 1).VLong(0);
  };
  constexpr int kTerms = 200'000;
  std::vector<std::unique_ptr<SelectedTerms>> segments;
  for (int segment = 0; segment < 3; ++segment) {
    ByteWriter out = ByteWriter().Int(-4).Long(kTerms).Int(1 << 20).Int(1 << 20).Int(1);
    const uint64_t first = out.size();
    for (int i = 0; i < kTerms; ++i) add(out, i + segment * 1000, i == 0, shared);
    ByteWriter index = ByteWriter().Int(-4).Long(1).Int(1 << 20).Int(1 << 20).Int(1);
    index.VInt(0).VInt(0).VInt(-1).VInt(0).VLong(0).VLong(0).VLong(first);
    format::SegmentFiles files;
    files.info.document_count = 1 << 20;
    files.field_infos = SourceOf(ByteWriter().VInt(-2).VInt(1).String("f").Byte(1).bytes());
    files.terms = SourceOf(out.bytes());
    files.terms_index = SourceOf(index.bytes());
    segments.push_back(
        std::make_unique<SelectedTerms>(std::move(files), format::TermSelection{.field = "f"}));
  }
  MergedTerms merged(std::move(segments));
  const std::clock_t start = std::clock();
  int terms = 0;
  while (merged.Next()) ++terms;
  EXPECT_EQ(terms, kTerms + 2000);
  EXPECT_LT(static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC, 5);
}

}  // namespace
}  // namespace vantrel::elastic
