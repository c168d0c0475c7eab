#include "elastic/suggest/best_terms.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>

namespace vantrel::elastic {
namespace {

using Terms = std::vector<SuggestedTerm>;

TEST(BestTermsTest, KeepsTheMostFrequentAndOfEqualOnesTheFirst) {
  BestTerms best(3);
  for (const auto& [term, frequency] : Terms{{"b", 2}, {"d", 7}, {"a", 1}, {"c", 2}, {"aa", 2}}) {
    best.Add(term, frequency);
  }
  EXPECT_EQ(best.Take(), (Terms{{"d", 7}, {"aa", 2}, {"b", 2}}));
  EXPECT_EQ(best.Take(), Terms()) << "nothing is left";
}

TEST(BestTermsTest, ComparesTermsByTheirBytes) {
  BestTerms best(10);
  for (const char* term : {"z", "\xc3\xa4", "Z", "\xf0\x9f\x98\x80", "\xef\xbf\xbd"}) best.Add(term, 1);
  EXPECT_EQ(best.Take(),
            (Terms{{"Z", 1}, {"z", 1}, {"\xc3\xa4", 1}, {"\xef\xbf\xbd", 1}, {"\xf0\x9f\x98\x80", 1}}));
}

TEST(BestTermsTest, TellsBeforehandWhatItWouldTake) {
  BestTerms best(2);
  EXPECT_TRUE(best.WouldTake("x", 0));
  best.Add("m", 5);
  best.Add("n", 3);
  EXPECT_FALSE(best.WouldTake("o", 3)) << "as frequent, but later";
  EXPECT_TRUE(best.WouldTake("k", 3)) << "as frequent, and earlier";
  EXPECT_TRUE(best.WouldTake("o", 4));
  EXPECT_FALSE(best.WouldTake("a", 2));
}

TEST(BestTermsTest, TakesNothingWhereNothingIsWanted) {
  BestTerms best(0);
  EXPECT_FALSE(best.WouldTake("a", 100));
  best.Add("a", 100);
  EXPECT_EQ(best.Take(), Terms());
}

TEST(BestTermsTest, IsTheFrontOfAllSorted) {
  std::mt19937 random(7);
  for (int round = 0; round < 200; ++round) {
    Terms all;
    for (uint32_t i = 0; i < random() % 60; ++i) all.push_back({std::to_string(1000 + i), random() % 5});
    std::shuffle(all.begin(), all.end(), random);
    const uint64_t most = random() % 20;
    BestTerms best(most);
    for (const auto& [term, frequency] : all) best.Add(term, frequency);
    std::sort(all.begin(), all.end(), [](const SuggestedTerm& left, const SuggestedTerm& right) {
      return left.document_frequency != right.document_frequency
                 ? left.document_frequency > right.document_frequency
                 : left.term < right.term;
    });
    all.resize(std::min<size_t>(all.size(), most));
    EXPECT_EQ(best.Take(), all) << "round " << round;
  }
}

}  // namespace
}  // namespace vantrel::elastic
