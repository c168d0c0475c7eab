// The judge of the runs must itself be right.

#include "document_model.h"

#include <gmock/gmock.h>

namespace quorelastic::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

class DocumentModelTest : public ::testing::Test {
 protected:
  // A request that is answered at once.
  void Write(const std::string& id, uint64_t version, bool commit) {
    model_.Acknowledge(model_.Begin({{id, version}}), commit);
  }

  void Commit() { model_.Acknowledge(model_.Begin({}), true); }

  DocumentModel model_;
};

TEST_F(DocumentModelTest, WhatWasNotCommittedMayBeThereOrNot) {
  Write("a", 1, false);
  Write("b", 2, false);
  EXPECT_THAT(model_.Compare({{"b", 2}}), IsEmpty());
}

TEST_F(DocumentModelTest, WhatWasCommittedMustBeThere) {
  Write("a", 1, true);
  EXPECT_THAT(model_.Compare({}),
              ElementsAre("a: found version 0, although version 1 was committed after it"));
}

TEST_F(DocumentModelTest, ALaterCommitOfAnybodyCounts) {
  Write("a", 1, false);
  Commit();
  EXPECT_THAT(model_.Compare({}),
              ElementsAre("a: found version 0, although version 1 was committed after it"));
}

TEST_F(DocumentModelTest, ACommitSentBeforeTheAcknowledgementNeedNotCount) {
  const auto commit = model_.Begin({});
  Write("a", 1, false);
  model_.Acknowledge(commit, true);
  EXPECT_THAT(model_.Compare({}), IsEmpty());
}

TEST_F(DocumentModelTest, ADeletionThatWasCommittedIsNotUndone) {
  Write("a", 1, true);
  Write("a", 0, true);
  EXPECT_THAT(model_.Compare({{"a", 1}}),
              ElementsAre("a: found version 1, although version 0 was committed after it"));
}

TEST_F(DocumentModelTest, ADeletionMayBeThereAgain) {
  Write("a", 0, true);
  Write("a", 1, true);
  Write("a", 0, true);
  EXPECT_THAT(model_.Compare({}), IsEmpty());
}

TEST_F(DocumentModelTest, ALaterVersionThatWasOnlySentMayBeThere) {
  Write("a", 1, true);
  model_.Begin({{"a", 2}});
  EXPECT_THAT(model_.Compare({{"a", 2}}), IsEmpty());
}

TEST_F(DocumentModelTest, OfRequestsThatOverlapEitherMayBeTheLast) {
  const auto first = model_.Begin({{"a", 1}});
  const auto second = model_.Begin({{"a", 2}});
  model_.Acknowledge(second, true);
  model_.Acknowledge(first, true);
  EXPECT_THAT(model_.Compare({{"a", 1}}), IsEmpty());
}

TEST_F(DocumentModelTest, WhatNobodyWroteMustNotBeThere) {
  Write("a", 1, true);
  EXPECT_THAT(model_.Compare({{"a", 7}, {"b", 1}}),
              ElementsAre("b: nobody wrote it", "a: found version 7, which nobody wrote"));
}

TEST_F(DocumentModelTest, WhatWasFoundOnceMustStay) {
  Write("a", 1, false);
  EXPECT_THAT(model_.Compare({{"a", 1}}), IsEmpty());
  EXPECT_THAT(model_.Compare({}), ElementsAre("a: found version 0, which nobody wrote"));
}

}  // namespace
}  // namespace quorelastic::testing
