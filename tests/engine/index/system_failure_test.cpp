// What the system refuses while an index is searched or written is told as that, and not as damage. The call that reads
// files is stood in for, so that a test can let it fail.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <filesystem>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "read_back.h"
#include "support/open_files.h"
#include "support/sanitized.h"
#include "support/temporary_folder.h"
#include "support/without_rights.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/index_info.h"
#include "vantrel/elastic/index_repair.h"
#include "vantrel/elastic/search.h"
#include "vantrel/elastic/suggest_terms.h"

namespace {

std::atomic<int> reads = 0;
int first_failing = -1;  // of these; none where it is negative
int failing = 0;         // so many

// Of the reads to come, some fail, the first one being number 0.
void FailReads(int first, int count = 1) {
  reads = 0;
  first_failing = first;
  failing = count;
}

// No more reads fail. Returns whether one did since the call before.
bool has_failed = false;
void StopFailingReadsForNow() {
  has_failed = has_failed || (first_failing >= 0 && reads > first_failing);
  first_failing = -1;
}
bool StopFailingReads() {
  StopFailingReadsForNow();
  return std::exchange(has_failed, false);
}

}  // namespace

// By its symbol alone: the C library's headers may define the function themselves.
extern "C" __attribute__((visibility("default"))) ssize_t StandInForPread(int descriptor, void* bytes,
                                                                          size_t count,
                                                                          off_t offset) __asm__("pread");
ssize_t StandInForPread(int descriptor, void* bytes, size_t count, off_t offset) {
  const int read = reads++;
  if (first_failing >= 0 && read >= first_failing && read < first_failing + failing) {
    errno = EIO;
    return -1;
  }
  return syscall(SYS_pread64, descriptor, bytes, count, offset);
}

namespace vantrel::elastic {
namespace {

namespace fs = std::filesystem;
using ::quorelastic::testing::FewOpenFiles;
using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::kIsSanitized;
using ::quorelastic::testing::kSanitizerNeedsDescriptors;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WithoutRights;
using ::testing::HasSubstr;

// Two segments of several files each, with a manifest or without.
class SystemFailureTest : public ::testing::TestWithParam<bool> {
 protected:
  SystemFailureTest() {
    IndexSettings settings = IdAndBody();
    settings.compound_files = false;
    const auto index = Index::Create(path_, settings);
    for (const char* id : {"a", "b"}) {
      index->Add(MakeDocument(id, "red word"));
      index->Commit();
    }
    if (!GetParam()) fs::remove(path_ + "/quorelastic.manifest");
  }

  // Puts the commit before the newest one back, as where its writer could not remove it. Its only segment is the first
  // one, which the newest commit has as well.
  void PutBackTheCommitBefore() const {
    const std::string newest = path_ + "/segments_3";
    const std::string before = path_ + "/segments_2";
    ASSERT_TRUE(fs::exists(newest) && !fs::exists(before));
    const TemporaryFolder other;
    {
      IndexSettings settings = IdAndBody();
      settings.compound_files = false;
      const auto index = Index::Create(other / "index", settings);
      index->Add(MakeDocument("a", "red word"));
      index->Commit();
    }
    fs::copy(other / "index/segments_2", before);
    fs::permissions(before, fs::perms::all);
  }
  ~SystemFailureTest() override { StopFailingReads(); }

  void SetUp() override {
    // A repair looks at it as somebody else.
    fs::permissions(folder_.path(), fs::perms::all);
    fs::permissions(path_, fs::perms::all);
  }

  static uint64_t CountWords(const Index& index) {
    SearchRequest request;
    request.query = "body:word";
    return index.Search(request).total;
  }

  // Whether an operation is refused by the system, for that reason. It may do without what it was refused; no other
  // error is right.
  template <typename Operation>
  static bool IsRefused(int reason, Operation operation) {
    try {
      operation();
    } catch (const IndexIoError& error) {
      EXPECT_EQ(error.error_number(), reason) << error.what();
      return true;
    } catch (const IndexError& error) {
      ADD_FAILURE() << error.what();
    }
    return false;
  }

  // Does it with ever more descriptors until there are enough; returns how often there were not.
  template <typename Operation>
  static int CountRefusalsOfDescriptors(Operation operation) {
    constexpr rlim_t kMost = 100;
    for (rlim_t more = 0; more < kMost; ++more) {
      if (!IsRefused(EMFILE, [&] { operation(more); })) return static_cast<int>(more);
    }
    ADD_FAILURE() << "not even with " << kMost << " descriptors";
    return 0;
  }

  // Does it with a first, a second, a third ... read that fails, until none does; returns how often that was told.
  template <typename Operation>
  static int CountRefusalsOfReads(Operation operation) {
    int refusals = 0;
    for (int read = 0;; ++read) {
      SCOPED_TRACE("read " + std::to_string(read));
      if (IsRefused(EIO, [&] { operation(read); })) ++refusals;
      if (!StopFailingReads()) return refusals;
    }
  }

  const TemporaryFolder folder_;
  const std::string path_ = folder_ / "index";
};

INSTANTIATE_TEST_SUITE_P(, SystemFailureTest, ::testing::Bool(),
                         [](const auto& test) { return test.param ? "WithAManifest" : "WithoutOne"; });

TEST_P(SystemFailureTest, ASearchThatCannotOpenAFileTellsTheSystemsReason) {
  if (kIsSanitized) GTEST_SKIP() << kSanitizerNeedsDescriptors;
  const int refusals = CountRefusalsOfDescriptors([&](rlim_t more) {
    const auto index = Index::Open(path_);
    const FewOpenFiles few(more);
    EXPECT_EQ(CountWords(*index), 2U);
  });
  EXPECT_GT(refusals, 5);
}

TEST_P(SystemFailureTest, AMergeThatCannotOpenAFileTellsTheSystemsReasonAndLosesNothing) {
  if (kIsSanitized) GTEST_SKIP() << kSanitizerNeedsDescriptors;
  const int refusals = CountRefusalsOfDescriptors([&](rlim_t more) {
    const auto index = Index::Open(path_);
    const FewOpenFiles few(more);
    index->Optimize();
  });
  EXPECT_GT(refusals, 5);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

TEST_P(SystemFailureTest, ASearchThatCannotReadTellsTheSystemsReasonAndTheNextOneAnswers) {
  int refusals = 0;
  bool has_failed = true;
  for (int read = 0; has_failed; ++read) {
    const auto index = Index::Open(path_);
    FailReads(read);
    if (IsRefused(EIO, [&] { EXPECT_EQ(CountWords(*index), 2U); })) ++refusals;
    has_failed = StopFailingReads();
    EXPECT_EQ(CountWords(*index), 2U) << "after read " << read;
  }
  EXPECT_GT(refusals, 5);
}

TEST_P(SystemFailureTest, AMergeThatCannotReadTellsTheSystemsReasonAndLosesNothing) {
  const int refusals = CountRefusalsOfReads([&](int read) {
    const auto index = Index::Open(path_);
    FailReads(read);
    index->Optimize();
    index->Commit();
  });
  EXPECT_GT(refusals, 3);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

TEST_P(SystemFailureTest, ASearchIsNeverAnsweredFromTheCommitBefore) {
  PutBackTheCommitBefore();
  CountRefusalsOfReads([&](int read) {
    const auto index = Index::Open(path_);
    FailReads(read);
    EXPECT_EQ(CountWords(*index), 2U);
  });
  if (kIsSanitized) GTEST_SKIP() << kSanitizerNeedsDescriptors;
  CountRefusalsOfDescriptors([&](rlim_t more) {
    const auto index = Index::Open(path_);
    const FewOpenFiles few(more);
    EXPECT_EQ(CountWords(*index), 2U);
  });
}

TEST_P(SystemFailureTest, AWriterNeverGoesOnFromTheCommitBefore) {
  CountRefusalsOfReads([&](int read) {
    const TemporaryFolder copy;
    PutBackTheCommitBefore();
    fs::copy(path_, copy / "index", fs::copy_options::recursive);
    fs::remove(path_ + "/segments_2");
    const auto index = Index::Open(copy / "index");
    FailReads(read);
    try {
      index->Add(MakeDocument("c", "red word"));
      index->Commit();
    } catch (const IndexIoError&) {
      StopFailingReadsForNow();
      EXPECT_EQ(CountWords(*Index::Open(copy / "index")), 2U);
      throw;
    }
    StopFailingReadsForNow();
    EXPECT_EQ(CountWords(*Index::Open(copy / "index")), 3U);
  });
}

TEST_P(SystemFailureTest, ACommitThatMayNotBeReadIsARefusalWithTheCommitBeforeBesideIt) {
  PutBackTheCommitBefore();
  fs::permissions(path_ + "/segments_3", fs::perms::none);
  {
    const WithoutRights rights;
    EXPECT_TRUE(IsRefused(EACCES, [&] { CheckIndexHealth(path_); }));
    EXPECT_TRUE(IsRefused(EACCES, [&] { PlanRepair(path_); }));
    EXPECT_TRUE(IsRefused(EACCES, [&] { SuggestTerms({path_}, {.field = "body", .prefix = "w"}); }));
    EXPECT_TRUE(IsRefused(EACCES, [&] { IndexInfo(path_).initialize(); }));
    EXPECT_TRUE(IsRefused(EACCES, [&] { Index::Open(path_)->Statistics(); }));
  }
  fs::permissions(path_ + "/segments_3", fs::perms::owner_all);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

TEST_P(SystemFailureTest, ASearchWhoseFileIsGoneSpeaksOfDamage) {
  fs::remove(path_ + "/_0.frq");
  try {
    CountWords(*Index::Open(path_));
    ADD_FAILURE() << "it was searched";
  } catch (const IndexIoError& error) {
    ADD_FAILURE() << error.what();
  } catch (const IndexError& error) {
    EXPECT_THAT(error.what(), HasSubstr("_0.frq"));
  }
}

TEST_P(SystemFailureTest, SearchesThatFailTogetherEachTellTheSystemsReason) {
  constexpr int kSearches = 4;
  for (int round = 0; round < 50; ++round) {
    const auto index = Index::Open(path_);
    FailReads(round % 12, kSearches);
    std::vector<std::thread> threads;
    threads.reserve(kSearches);
    for (int i = 0; i < kSearches; ++i) {
      threads.emplace_back([&] { IsRefused(EIO, [&] { EXPECT_EQ(CountWords(*index), 2U); }); });
    }
    for (std::thread& thread : threads) thread.join();
    StopFailingReads();
  }
}

TEST_P(SystemFailureTest, ARepairThatCannotReadChangesNothing) {
  const int refusals = CountRefusalsOfReads([&](int read) {
    FailReads(read);
    EXPECT_TRUE(RepairIndex(path_).is_clean);
  });
  EXPECT_GT(refusals, 5);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

TEST_P(SystemFailureTest, ARepairThatCannotOpenAFileChangesNothing) {
  if (kIsSanitized) GTEST_SKIP() << kSanitizerNeedsDescriptors;
  const int refusals = CountRefusalsOfDescriptors([&](rlim_t more) {
    const FewOpenFiles few(more);
    EXPECT_TRUE(RepairIndex(path_).is_clean);
  });
  EXPECT_GT(refusals, 5);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

TEST_P(SystemFailureTest, ARepairByWhoMayNotReadASegmentChangesNothing) {
  const std::string file = path_ + "/_1.tis";
  fs::permissions(file, fs::perms::none);
  for (const auto repair : {RepairIndex, PlanRepair}) {
    const WithoutRights rights;
    EXPECT_TRUE(IsRefused(EACCES, [&] { repair(path_); }));
  }
  fs::permissions(file, fs::perms::owner_all);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

}  // namespace
}  // namespace vantrel::elastic
