#include "elastic/repair/blame.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>
#include <vector>

namespace vantrel::elastic {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::IsSubsetOf;
using ::testing::Le;
using ::testing::SizeIs;
using SegmentSet = std::set<std::string>;

std::vector<std::string> Segments(int count) {
  std::vector<std::string> names;
  for (int i = 0; i < count; ++i) {
    names.emplace_back("_");
    names.back() += std::to_string(i);
  }
  return names;
}

class BlameTest : public ::testing::Test {
 protected:
  // Of a run that fails where all segments of one of `harmful` are there.
  SegmentSet Find(const std::vector<std::string>& suspects, const std::vector<SegmentSet>& harmful) {
    trials_ = 0;
    return FindBlame(suspects, [&](const SegmentSet& without) {
      ++trials_;
      return std::none_of(harmful.begin(), harmful.end(), [&](const SegmentSet& together) {
        return std::none_of(together.begin(), together.end(),
                            [&](const std::string& name) { return without.contains(name); });
      });
    });
  }

  int trials_ = 0;
};

TEST_F(BlameTest, IsOfTheOneSegmentWhereverItStands) {
  for (const int count : {1, 2, 3, 9, 10, 64}) {
    for (const std::string& name : Segments(count)) {
      EXPECT_THAT(Find(Segments(count), {{name}}), ElementsAre(name)) << "of " << count;
      EXPECT_LE(trials_, 12);
    }
  }
}

TEST_F(BlameTest, IsOfEachSegmentThatIsHarmfulByItself) {
  EXPECT_THAT(Find(Segments(10), {{"_2"}, {"_9"}}), ElementsAre("_2", "_9"));
  EXPECT_THAT(Find(Segments(3), {{"_0"}, {"_1"}, {"_2"}}), ElementsAre("_0", "_1", "_2"));
}

TEST_F(BlameTest, IsOfTheLaterOneWhereTwoAreHarmfulTogether) {
  EXPECT_THAT(Find(Segments(10), {{"_1", "_9"}}), ElementsAre("_9"));
  EXPECT_THAT(Find({"_9", "_4", "_1"}, {{"_1", "_9"}}), ElementsAre("_1"));
}

TEST_F(BlameTest, IsOfNoSegmentWithoutSuspects) {
  EXPECT_THAT(Find({}, {}), IsEmpty());
  EXPECT_EQ(trials_, 0);
}

TEST_F(BlameTest, IsOfTheRestWhereTheTrialsAreUsedUp) {
  const std::vector<std::string> suspects = Segments(1000);
  std::vector<SegmentSet> harmful;
  SegmentSet odd;
  for (size_t i = 1; i < suspects.size(); i += 2) {
    harmful.push_back({suspects[i]});
    odd.insert(suspects[i]);
  }
  const SegmentSet blamed = Find(suspects, harmful);
  EXPECT_EQ(trials_, kMostBlameTrials);
  EXPECT_THAT(odd, IsSubsetOf(blamed));
  EXPECT_THAT(blamed, SizeIs(Le(suspects.size())));
}

}  // namespace
}  // namespace vantrel::elastic
