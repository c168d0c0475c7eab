// What requests that change an index at the same time are told of each other's failures.

#include <gtest/gtest.h>

#include <cerrno>
#include <memory>

#include "data_root/open_index.h"
#include "registry_fixture.h"
#include "support/file_size_limit.h"
#include "vantrel/elastic/index_error.h"

namespace quorelasticd {
namespace {

using quorelastic::testing::FileSizeLimit;
using vantrel::elastic::Index;
using vantrel::elastic::IndexIoError;

class ChangesTest : public RegistryTest {
 protected:
  ChangesTest() {
    registry_.Create("x", Settings());
    open_ = registry_.Use("x");
  }

  static void Fail(Changes& changes) {
    EXPECT_THROW(changes.Apply([](Index&) { throw IndexIoError("/x", "cannot write", ENOSPC); }),
                 IndexIoError);
  }

  static void Add(Changes& changes) {
    changes.Apply([](Index& index) { index.Add({{{"id", "1"}}}); });
  }

  std::shared_ptr<OpenIndex> open_;
};

TEST_F(ChangesTest, AFailureUnderOneRequestIsNoticedByAnother) {
  Changes one(open_);
  Changes another(open_);
  Add(one);
  Fail(another);
  EXPECT_EQ(Failure([&] { Add(one); }), ErrorCode::kIoError);
  EXPECT_EQ(Failure([&] { one.Commit(); }), ErrorCode::kIoError);
  Changes later(open_);
  Add(later);
  EXPECT_NO_THROW(later.Commit());
}

TEST_F(ChangesTest, AValueThatIsRefusedDoesNoHarm) {
  Changes one(open_);
  Changes another(open_);
  Add(one);
  EXPECT_THROW(another.Apply([](Index& index) {
    index.Add({{{"unknown", "1"}}});
  }),
               vantrel::elastic::IndexValueError);
  Add(one);
  EXPECT_NO_THROW(one.Commit());
}

TEST_F(ChangesTest, ABrokenPromiseIsReportedOnce) {
  Changes promised(open_);
  Add(promised);
  promised.Promise();
  Changes failing(open_);
  Fail(failing);
  Changes bulk(open_);
  Add(bulk);
  bulk.Commit();
  Changes commit(open_);
  commit.Commit();
  EXPECT_EQ(Failure([&] { commit.ReportBrokenPromise(); }), ErrorCode::kIoError);
  EXPECT_NO_THROW(commit.ReportBrokenPromise());
}

TEST_F(ChangesTest, WhatAFailureLostIsNoReasonToRefuseALaterCommit) {
  Changes promised(open_);
  Add(promised);
  promised.Promise();
  Changes failing(open_);
  {
    const FileSizeLimit full_disk(0);
    EXPECT_THROW(failing.Apply([](Index& index) { index.Optimize(); }), IndexIoError);
  }
  Changes later(open_);
  Add(later);
  EXPECT_NO_THROW(later.Commit());
  EXPECT_EQ(open_->index().CountDocuments().live, 1u);
}

TEST_F(ChangesTest, ThatCannotBeCommittedBeforeARepairAreToldToBeLost) {
  {
    Changes promised(open_);
    Add(promised);
    promised.Promise();
  }
  open_.reset();
  {
    const FileSizeLimit full_disk(0);
    EXPECT_EQ(Failure([&] { registry_.Close("x"); }), ErrorCode::kIoError);
  }
  EXPECT_EQ(registry_.Use("x")->index().CountDocuments().live, 0u);
  EXPECT_NE(registry_.Close("x"), nullptr);
}

TEST_F(ChangesTest, ThatAreCommittedAtTheEndWaitForNoMerge) {
  constexpr uint64_t kCommits = 12;  // more than the segments that are left unmerged
  for (uint64_t i = 0; i < kCommits; ++i) {
    Changes changes(open_);
    Add(changes);
    changes.Promise();
    ASSERT_TRUE(registry_.CommitAll());
  }
  EXPECT_EQ(open_->index().Statistics().segments, kCommits);
  Changes last(open_);
  Add(last);
  last.Commit();
  EXPECT_LT(open_->index().Statistics().segments, kCommits);
  EXPECT_EQ(open_->index().CountDocuments().live, kCommits + 1);
}

TEST_F(ChangesTest, AKeptPromiseIsNotReported) {
  Changes promised(open_);
  Add(promised);
  promised.Promise();
  Changes commit(open_);
  commit.Commit();
  Changes failing(open_);
  Fail(failing);
  Changes last(open_);
  EXPECT_NO_THROW(last.ReportBrokenPromise());
}

}  // namespace
}  // namespace quorelasticd
