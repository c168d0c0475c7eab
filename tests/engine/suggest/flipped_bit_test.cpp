// Suggestions and listings from dictionaries of which one bit is wrong.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <map>
#include <optional>
#include <random>

#include "engine/suggest/plain_dictionary.h"
#include "support/files.h"
#include "support/library_index.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/suggest_terms.h"
#include "vantrel/elastic/term_listing.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::IsIndexOf;
using ::quorelastic::testing::IsWellFormed;
using ::quorelastic::testing::LibraryIndex;
using ::quorelastic::testing::PlainDictionary;
using ::quorelastic::testing::PlainDictionaryReader;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;

const std::vector<std::string> kPrefixes = {"",         "a", "t",     "tea",   "team",     "z",
                                            "\xce\xb1", "b", "cargo", "tower", "\xe4\xb8", "s"};
constexpr uint64_t kDocuments = 14;

// What is suggested for a prefix, and what is listed.
struct Answer {
  std::vector<SuggestedTerm> suggested;
  std::vector<std::string> listed;
};

class FlippedBitTest : public ::testing::TestWithParam<uint32_t> {
 protected:
  void SetUp() override {
    WriteIndex();
    for (const std::string& prefix : kPrefixes) truth_[prefix] = {Suggest(prefix), List(prefix)};
    for (const char* name : {"_0.tis", "_0.tii"}) bytes_[name] = ReadFile(folder_ / name);
    ASSERT_TRUE(IsGood()) << "the plain reading does not understand the index as it was written";
    ASSERT_GT(truth_["tea"].suggested.size(), 3U);
    ASSERT_EQ(truth_["tea"].suggested.size(), truth_["tea"].listed.size());
  }

  void WriteIndex() const {
    std::mt19937 random(GetParam());
    const std::vector<std::string> starts = {"tea",   "te",       "car", "cargo",       "a",
                                             "tower", "\xce\xb1", "z",   "\xe4\xb8\xad"};
    LibraryIndex index(folder_.path(), {.compound = false, .term_index_interval = 4});
    for (uint64_t i = 0; i < kDocuments; ++i) {
      std::string text;
      for (int word = 0; word < 6; ++word) {
        text += starts[random() % starts.size()];
        for (uint32_t left = random() % 4; left > 0; --left)
          text.push_back(static_cast<char>('a' + random() % 20));
        text.push_back(' ');
      }
      index.Add(
          {{.name = "body", .value = text}, {.name = "abc", .value = text}, {.name = "id", .value = text}});
    }
    index.Commit();
  }

  std::vector<SuggestedTerm> Suggest(const std::string& prefix) const {
    return SuggestTerms({folder_.path()}, {.field = "body", .prefix = prefix, .limit = 1000});
  }

  std::vector<std::string> List(const std::string& prefix) const {
    std::vector<std::string> terms;
    TermListing listing(folder_.path(), {.field = "body", .prefix = prefix});
    while (true) {
      const TermListing::Move move = listing.Next();
      if (move == TermListing::Move::kEnd) return terms;
      if (move == TermListing::Move::kTerm) terms.push_back(listing.text());
    }
  }

  // Whether the files as they are make a dictionary that could have been written so, with its index.
  bool IsGood() const {
    const auto dictionary = PlainDictionaryReader(bytes_.at("_0.tis"), false).Read();
    const auto index = PlainDictionaryReader(bytes_.at("_0.tii"), true).Read();
    return dictionary.has_value() && index.has_value() &&
           IsWellFormed(*dictionary, {"body", "abc", "id"}, kDocuments) && IsIndexOf(*index, *dictionary);
  }

  // Flips each bit of a file in turn, and looks at what comes of it. `may_hide` tells of wrong terms whether
  // the damage behind it cannot be seen; the bytes are the damaged ones, and the bit is the damaged one.
  void FlipEachBitOf(const std::string& name, const std::function<bool(size_t bit)>& may_hide) {
    std::string& bytes = bytes_[name];
    const size_t step = quorelastic::testing::kIsSanitized ? 61 : 1;
    for (size_t bit = 0; bit < bytes.size() * 8; bit += step) {
      const std::string undamaged = bytes;
      bytes[bit / 8] = static_cast<char>(bytes[bit / 8] ^ 1 << bit % 8);
      // As a new file, which is quicker: some file systems flush one that is rewritten.
      std::filesystem::remove(folder_ / name);
      WriteFile(folder_ / name, bytes);
      std::optional<bool> hides;
      for (const std::string& prefix : kPrefixes) {
        if (IsTrueOrAnError(prefix)) continue;
        if (!hides.has_value()) hides = may_hide(bit);
        EXPECT_TRUE(*hides) << name << ", bit " << bit << ": wrong terms for '" << prefix << "'";
      }
      bytes = undamaged;
    }
    WriteFile(folder_ / name, bytes);
    EXPECT_GT(errors_ * step, 1000U) << "hardly a damage was seen";
  }

  bool IsTrueOrAnError(const std::string& prefix) {
    const bool suggests = EndsInTrueOrAnError([&] { return Suggest(prefix) == truth_[prefix].suggested; });
    return EndsInTrueOrAnError([&] { return List(prefix) == truth_[prefix].listed; }) && suggests;
  }

  bool EndsInTrueOrAnError(const std::function<bool()>& ask) {
    try {
      return ask();
    } catch (const IndexDamagedError& error) {
      ++errors_;
      EXPECT_EQ(error.path().rfind(folder_ / "_0.ti", 0), 0U) << error.what();
      return true;
    }
  }

  TemporaryFolder folder_;
  std::map<std::string, Answer> truth_;
  std::map<std::string, std::string> bytes_;
  uint64_t errors_ = 0;
};

INSTANTIATE_TEST_SUITE_P(Seeds, FlippedBitTest, ::testing::Values(1, 2));

// Unseen is only what leaves a dictionary that could have been written so: its terms ascend, and are what the index
// repeats of them.
TEST_P(FlippedBitTest, OfTheDictionaryShowsUnlessItLeavesAnotherOneThatIsAsGood) {
  FlipEachBitOf("_0.tis", [&](size_t /*bit*/) { return IsGood(); });
}

// Unseen is only an entry that pretends to share more with the one before it than it does.
TEST_P(FlippedBitTest, OfTheIndexOverTheDictionaryShowsUnlessAnEntrySharesTooMuchByIt) {
  const auto index = PlainDictionaryReader(bytes_["_0.tii"], true).Read();
  FlipEachBitOf("_0.tii", [&](size_t bit) {
    const bool is_shared_length =
        std::any_of(index->terms.begin(), index->terms.end(),
                    [&](const PlainDictionary::Term& entry) { return entry.start == bit / 8; });
    const bool is_set = (bytes_["_0.tii"][bit / 8] >> bit % 8 & 1) != 0;
    return is_shared_length && is_set;
  });
}

}  // namespace
}  // namespace vantrel::elastic
