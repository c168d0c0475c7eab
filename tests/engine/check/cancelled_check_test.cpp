// How soon a check calls its progress callback, and ends where that throws, whatever it reads.

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <stdexcept>
#include <string>
#include <thread>

#include "elastic/check/index_check.h"
#include "support/byte_writer.h"
#include "support/memory_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::MemoryFile;
using ::quorelastic::testing::MemoryFolder;

constexpr int kSegments = 4;
constexpr std::chrono::milliseconds kReadTime{5};
constexpr int kReadsIn100Milliseconds = 20;

// Segments whose files of deleted documents take several thousand reads each. Their other files are missing.
class SlowIndex {
 public:
  SlowIndex() {
    constexpr int kDocuments = 1 << 28;
    ByteWriter commit = ByteWriter().Int(-2).Long(1).Int(kSegments).Int(kSegments);
    for (int segment = 0; segment < kSegments; ++segment) {
      const std::string name = "_" + std::to_string(segment);
      commit.String(name).Int(kDocuments).Long(1).Int(-1).Byte(0xff);
      MemoryFile& deletions = folder_.files[name + "_1.del"];
      deletions.bytes = ByteWriter().Int(kDocuments).Int(0).bytes();
      deletions.zeros_after = kDocuments / 8 + 1;
      deletions.before_read = [this] {
        ++reads_;
        std::this_thread::sleep_for(kReadTime);
      };
    }
    folder_.files["segments_1"].bytes = commit.bytes();
  }

  const MemoryFolder& folder() const { return folder_; }
  int reads() const { return reads_; }

 private:
  MemoryFolder folder_;
  std::atomic<int> reads_ = 0;
};

class CancelledCheckTest : public ::testing::TestWithParam<int> {};

TEST_P(CancelledCheckTest, EndsSoonHoweverSlowReadingIs) {
  const int threads = GetParam();
  const SlowIndex index;
  int reads_at_call = 0;
  const HealthOptions options{.threads = static_cast<unsigned>(threads),
                              .progress = [&](const HealthProgress&) {
                                reads_at_call = index.reads();
                                throw std::length_error("stop");
                              }};
  EXPECT_THROW(check::CheckFolder(index.folder(), options), std::length_error);
  EXPECT_GT(reads_at_call, 0);
  EXPECT_LE(reads_at_call, threads * kReadsIn100Milliseconds);
  EXPECT_LE(index.reads() - reads_at_call, threads * kReadsIn100Milliseconds);
}

INSTANTIATE_TEST_SUITE_P(WithThreads, CancelledCheckTest, ::testing::Values(1, kSegments));

}  // namespace
}  // namespace vantrel::elastic
