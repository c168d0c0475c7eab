// What the system refuses while an index is searched or written is told as that, and not as damage. The call that reads
// files is stood in for, so that a test can let it fail.

#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <filesystem>
#include <iterator>
#include <string>

#include "read_back.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search.h"

namespace {

// How many reads go well until one fails; none does where it is negative.
std::atomic<int> reads_before_failure = -1;

}  // namespace

extern "C" __attribute__((visibility("default"))) ssize_t pread(int descriptor, void* bytes, size_t count,
                                                                off_t offset) {
  if (reads_before_failure >= 0 && reads_before_failure-- == 0) {
    errno = EIO;
    return -1;
  }
  return syscall(SYS_pread64, descriptor, bytes, count, offset);
}

namespace vantrel::elastic {
namespace {

namespace fs = std::filesystem;
using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::TemporaryFolder;

// As long as it lives, this process opens no more than `more` files beside those that are open.
class FewDescriptors {
 public:
  explicit FewDescriptors(rlim_t more) {
    const fs::directory_iterator open("/proc/self/fd");
    const auto count = std::distance(begin(open), end(open)) - 1;  // without the listing's own
    getrlimit(RLIMIT_NOFILE, &before_);
    rlimit few = before_;
    few.rlim_cur = static_cast<rlim_t>(count) + more;
    setrlimit(RLIMIT_NOFILE, &few);
  }
  FewDescriptors(const FewDescriptors&) = delete;
  FewDescriptors& operator=(const FewDescriptors&) = delete;
  ~FewDescriptors() { setrlimit(RLIMIT_NOFILE, &before_); }

 private:
  rlimit before_{};
};

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
  ~SystemFailureTest() override { reads_before_failure = -1; }

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
      if (reads_before_failure.exchange(-1) >= 0) return refusals;
    }
  }

  const TemporaryFolder folder_;
  const std::string path_ = folder_ / "index";
};

INSTANTIATE_TEST_SUITE_P(, SystemFailureTest, ::testing::Bool(),
                         [](const auto& test) { return test.param ? "WithAManifest" : "WithoutOne"; });

TEST_P(SystemFailureTest, ASearchThatCannotOpenAFileTellsTheSystemsReason) {
  const int refusals = CountRefusalsOfDescriptors([&](rlim_t more) {
    const auto index = Index::Open(path_);
    const FewDescriptors few(more);
    EXPECT_EQ(CountWords(*index), 2U);
  });
  EXPECT_GT(refusals, 5);
}

TEST_P(SystemFailureTest, AMergeThatCannotOpenAFileTellsTheSystemsReasonAndLosesNothing) {
  const int refusals = CountRefusalsOfDescriptors([&](rlim_t more) {
    const auto index = Index::Open(path_);
    const FewDescriptors few(more);
    index->Optimize();
  });
  EXPECT_GT(refusals, 5);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

TEST_P(SystemFailureTest, ASearchThatCannotReadTellsTheSystemsReasonAndTheNextOneAnswers) {
  const int refusals = CountRefusalsOfReads([&](int read) {
    const auto index = Index::Open(path_);
    reads_before_failure = read;
    const bool is_refused = IsRefused(EIO, [&] { EXPECT_EQ(CountWords(*index), 2U); });
    const int left = reads_before_failure.exchange(-1);
    EXPECT_EQ(CountWords(*index), 2U);
    reads_before_failure = left;
    if (is_refused) throw IndexIoError(path_, "told", EIO);
  });
  EXPECT_GT(refusals, 5);
}

TEST_P(SystemFailureTest, AMergeThatCannotReadTellsTheSystemsReasonAndLosesNothing) {
  const int refusals = CountRefusalsOfReads([&](int read) {
    const auto index = Index::Open(path_);
    reads_before_failure = read;
    index->Optimize();
    index->Commit();
  });
  EXPECT_GT(refusals, 3);
  EXPECT_EQ(CountWords(*Index::Open(path_)), 2U);
}

}  // namespace
}  // namespace vantrel::elastic
