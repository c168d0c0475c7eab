#include "vantrel/elastic/term_listing.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::TemporaryFolder;
using ::testing::ElementsAre;

std::string Padded(int number) {
  const std::string digits = std::to_string(number);
  return std::string(5 - digits.size(), '0').append(digits);
}

// Three segments with thousands of terms in each of three fields.
class TermListingTest : public ::testing::Test {
 protected:
  TermListingTest() {
    IndexSettings settings;
    settings.fields = {{.name = "a"}, {.name = "b"}, {.name = "c"}};
    const auto index = Index::Create(path(), settings);
    for (int segment = 0; segment < 3; ++segment) {
      std::string words;
      for (int i = segment; i < 9000; i += 3) words += " w" + Padded(i);
      index->Add(
          {{{"id", std::to_string(segment)}, {"a", words}, {"b", words + " ünder zoo"}, {"c", words}}});
      index->Commit();
    }
  }

  std::string path() const { return folder_ / "index"; }

  // What is selected, and how many other terms were passed.
  struct Walk {
    std::vector<std::string> terms;
    int passed_over = 0;
  };
  Walk WalkOver(const TermListingRequest& request) const {
    Walk walk;
    TermListing terms(path(), request);
    for (;;) {
      switch (terms.Next()) {
        case TermListing::Move::kEnd:
          return walk;
        case TermListing::Move::kPassedOver:
          ++walk.passed_over;
          break;
        case TermListing::Move::kTerm:
          walk.terms.push_back(terms.field() + ":" + terms.text());
      }
    }
  }

 private:
  TemporaryFolder folder_;
};

TEST_F(TermListingTest, AreFoundWithoutAWalkOverThoseBefore) {
  // In each segment, as many as stand between two entries of its index, and some such blocks that are only checked.
  constexpr int kPassed = 3 * 8 * 128;
  const Walk few = WalkOver({"b", "w0815"});
  EXPECT_THAT(few.terms, ElementsAre("b:w08150", "b:w08151", "b:w08152", "b:w08153", "b:w08154", "b:w08155",
                                     "b:w08156", "b:w08157", "b:w08158", "b:w08159"));
  EXPECT_LT(few.passed_over, kPassed);
  const Walk field = WalkOver({"c", ""});
  EXPECT_EQ(field.terms.size(), 9000U);
  EXPECT_EQ(field.terms.front(), "c:w00000");
  EXPECT_EQ(field.terms.back(), "c:w08999");
  EXPECT_LT(field.passed_over, kPassed);
  const Walk last = WalkOver({"b", "ü"});
  EXPECT_EQ(last.terms, std::vector<std::string>{"b:ünder"});
  EXPECT_LT(last.passed_over, kPassed);
}

TEST_F(TermListingTest, AreTheSameWhereverTheWalkBegins) {
  const Walk all = WalkOver({});
  EXPECT_EQ(all.terms.size(), 3U * 9000 + 2 + 3);
  for (const std::string& field : {std::string("a"), std::string("b"), std::string("c"), std::string("id")}) {
    for (const char* prefix :
         {"", "w", "w0", "w00000", "w08999", "w0899", "w1", "v", "z", "zoo", "zoom", "0", "1"}) {
      std::vector<std::string> expected;
      for (const std::string& term : all.terms) {
        if (term.starts_with(field + ":" + prefix)) expected.push_back(term);
      }
      EXPECT_EQ(WalkOver({field, prefix}).terms, expected) << field << ":" << prefix;
    }
  }
}

}  // namespace
}  // namespace vantrel::elastic
