#include "elastic/format/io/wide_scan.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <optional>
#include <random>
#include <string>
#include <vector>

#include "support/byte_writer.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;

// A block of memory that ends where the bytes end, so that a sanitizer sees what is read behind them.
std::vector<uint8_t> BytesOf(const std::string& text) { return {text.begin(), text.end()}; }

// The number at `next`, which moves behind it; nothing where it takes more than three bytes or goes past the end.
std::optional<uint32_t> TakeShort(const uint8_t*& next, const uint8_t* end) {
  uint32_t value = 0;
  for (int i = 0; i < 3 && next != end; ++i) {
    value |= (*next & 0x7fU) << (7 * i);
    if (*next++ < 0x80) return value;
  }
  return std::nullopt;
}

bool HasFourthByte(const uint8_t* next, const uint8_t* end) {
  int run = 0;
  for (const uint8_t* byte = next; byte != end && byte != next + kScanStep; ++byte) {
    run = *byte >= 0x80 ? run + 1 : 0;
    if (run == 3) return true;
  }
  return false;
}

class WideScanTest : public ::testing::TestWithParam<ScanInstructions> {
 protected:
  void SetUp() override {
    if (GetParam() == ScanInstructions::kWide && BestScanInstructions() != ScanInstructions::kWide) {
      GTEST_SKIP() << "this processor has no AVX2 with fast BMI2";
    }
  }

  uint32_t Random(uint32_t below) { return static_cast<uint32_t>(random_() % below); }
  // Of one to three bytes.
  uint32_t ShortNumber() { return 1 + Random(1U << (1 + Random(20))); }

  void ExpectSameNumbers(const std::string& text, uint64_t count) {
    const std::vector<uint8_t> bytes = BytesOf(text);
    const uint8_t* const end = bytes.data() + bytes.size();
    const uint8_t* next = bytes.data();
    uint64_t left = count;
    if (!PassShortVInts(GetParam(), next, end, left)) {
      EXPECT_TRUE(HasFourthByte(next, end));
      return;
    }
    ASSERT_LE(left, count);
    const uint8_t* expected = bytes.data();
    for (uint64_t i = left; i < count; ++i) ASSERT_TRUE(TakeShort(expected, end).has_value());
    EXPECT_EQ(next, expected);
    EXPECT_TRUE(left == 0 || end - next < static_cast<ptrdiff_t>(kScanStep));
  }

  // What is passed must be good one by one, too. Returns how many are.
  int32_t ExpectSamePostings(const std::string& text, int32_t count) {
    const std::vector<uint8_t> bytes = BytesOf(text);
    const uint8_t* const end = bytes.data() + bytes.size();
    const uint8_t* next = bytes.data();
    const PostingsRun run = PassPostings(GetParam(), next, end, count);
    EXPECT_LE(run.documents, count);
    const uint8_t* expected = bytes.data();
    uint64_t distance = 0;
    uint64_t occurrences = 0;
    for (int32_t i = 0; i < run.documents; ++i) {
      const uint32_t code = TakeShort(expected, end).value();
      const uint32_t frequency = (code & 1) != 0 ? 1 : TakeShort(expected, end).value();
      EXPECT_GT(code >> 1, 0U);
      EXPECT_GT(frequency, 0U);
      EXPECT_LE(frequency, kMostScannedFrequency);
      distance += code >> 1;
      occurrences += frequency;
    }
    EXPECT_EQ(next, expected);
    EXPECT_EQ(run.distance, distance);
    EXPECT_EQ(run.occurrences, occurrences);
    return run.documents;
  }

 private:
  std::mt19937 random_{1};
};

INSTANTIATE_TEST_SUITE_P(, WideScanTest,
                         ::testing::Values(ScanInstructions::kBaseline, ScanInstructions::kWide),
                         [](const auto& test) {
                           return test.param == ScanInstructions::kWide ? "Wide" : "Baseline";
                         });

TEST_P(WideScanTest, PassesNumbersOfAnyLengthFromAnyPlace) {
  for (uint64_t count = 0; count < 200; ++count) {
    SCOPED_TRACE(count);
    ByteWriter bytes;
    for (uint64_t i = 0; i < count; ++i) bytes.VInt(ShortNumber());
    for (const size_t behind : {0U, 1U, 15U, 31U, 63U, 64U, 65U}) {
      ExpectSameNumbers(bytes.bytes() + std::string(behind, 'x'), count);
      ExpectSameNumbers(bytes.bytes() + std::string(behind, '\xff'), count);
    }
  }
}

TEST_P(WideScanTest, StopsBeforeANumberOfFourBytesWhereverItStands) {
  for (size_t place = 0; place < 150; ++place) {
    SCOPED_TRACE(place);
    for (const uint32_t length : {4U, 5U, 70U}) {
      const std::string bytes =
          std::string(place, '\1') + std::string(length - 1, '\x80') + "\1" + std::string(100, '\1');
      ExpectSameNumbers(bytes, 200);
      ExpectSameNumbers(bytes, place);
      ExpectSameNumbers(bytes, place + 1);
    }
  }
}

TEST_P(WideScanTest, PassesOfRandomBytesOnlyShortNumbers) {
  for (int round = 0; round < 20000; ++round) {
    SCOPED_TRACE(round);
    std::string bytes(Random(200), '\0');
    const uint32_t rarity = 1 + Random(6);
    for (char& byte : bytes) byte = static_cast<char>(Random(128) | (Random(rarity) == 0 ? 0x80U : 0U));
    ExpectSameNumbers(bytes, Random(200));
  }
}

TEST_P(WideScanTest, AddsUpPostings) {
  const bool is_wide = GetParam() == ScanInstructions::kWide;
  for (int round = 0; round < 5000; ++round) {
    SCOPED_TRACE(round);
    const uint32_t rarity = 1 + Random(6);
    ByteWriter bytes;
    const auto count = static_cast<int32_t>(Random(130));
    for (int32_t i = 0; i < count; ++i) {
      const uint32_t frequency = Random(rarity) == 0 ? 2 + Random(126) : 1;
      bytes.VInt(int64_t{ShortNumber()} << 1 | (frequency == 1 ? 1 : 0));
      if (frequency != 1) bytes.VInt(frequency);
    }
    EXPECT_EQ(ExpectSamePostings(bytes.bytes() + std::string(kScanStep, '\x83'), count), is_wide ? count : 0);
    ExpectSamePostings(bytes.bytes(), count);
    ExpectSamePostings(bytes.bytes() + "x", count + 1);
  }
}

TEST_P(WideScanTest, AddsUpOfRandomBytesOnlyGoodPostings) {
  for (int round = 0; round < 30000; ++round) {
    SCOPED_TRACE(round);
    std::string bytes(Random(200), '\0');
    const uint32_t rarity = 1 + Random(6);
    const uint32_t largest = 1 + Random(127);
    for (char& byte : bytes) {
      byte = static_cast<char>(Random(largest + 1) | (Random(rarity) == 0 ? 0x80U : 0U));
    }
    ExpectSamePostings(bytes, static_cast<int32_t>(Random(140)));
  }
}

TEST_P(WideScanTest, PassesNoPostingThatOnlyOthersCanJudge) {
  const ByteWriter bad[] = {ByteWriter().VInt(1),                      // distance 0, once
                            ByteWriter().VInt(0).VInt(2),              // distance 0
                            ByteWriter().VInt(4).VInt(0),              // frequency 0
                            ByteWriter().VInt(4).VInt(1),              // a frequency that need not be there
                            ByteWriter().VInt(4).VInt(128),            // a frequency of two bytes
                            ByteWriter().VInt(1 << 21).VInt(2),        // a distance of four bytes
                            ByteWriter().Byte(0x81).Byte(0),           // distance 0 in two bytes
                            ByteWriter().Byte(0x80).Byte(0).VInt(2),   // the same, with a frequency
                            ByteWriter().Byte(4).Byte(0x80).Byte(0)};  // frequency 0 in two bytes
  for (const ByteWriter& posting : bad) {
    for (int32_t place = 0; place < 100; ++place) {
      SCOPED_TRACE(place);
      const std::string before(static_cast<size_t>(place), '\3');
      EXPECT_LE(ExpectSamePostings(before + posting.bytes() + std::string(100, '\3'), 130), place);
    }
  }
}

}  // namespace
}  // namespace vantrel::elastic::format
