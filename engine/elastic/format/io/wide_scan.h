#pragma once

#include <cstddef>
#include <cstdint>

namespace vantrel::elastic::format {

// Scans of many numbers of one to three bytes (VInts, see byte_reader.h) at a time. They count the bytes without a high
// bit, one of which ends each number, rather than decode.

// The instructions that a scan uses. The result does not depend on them.
enum class ScanInstructions {
  kBaseline,  // what every processor of the architecture has
  kWide,      // AVX2 and BMI2, on x86-64
};

// The widest ones that this processor runs fast.
ScanInstructions FindBestScanInstructions();
inline ScanInstructions BestScanInstructions() {
  static const ScanInstructions best = FindBestScanInstructions();
  return best;
}

// The scans read steps of this many bytes. They stop where fewer are left.
inline constexpr size_t kScanStep = 64;

// Moves `next` past `count` VInts, or as many as whole steps before `end` hold, and takes them off `count`. False where
// a number takes more than three bytes, or may; `next` and `count` are unspecified then.
bool PassShortVIntsBaseline(const uint8_t*& next, const uint8_t* end, uint64_t& count);
bool PassShortVIntsWide(const uint8_t*& next, const uint8_t* end, uint64_t& count);
inline bool PassShortVInts(ScanInstructions instructions, const uint8_t*& next, const uint8_t* end,
                           uint64_t& count) {
  return instructions == ScanInstructions::kWide ? PassShortVIntsWide(next, end, count)
                                                 : PassShortVIntsBaseline(next, end, count);
}

// Sums over a run of postings.
struct PostingsRun {
  int32_t documents = 0;
  uint64_t distance = 0;     // from the document before the run to its last one
  uint64_t occurrences = 0;  // of the term in these documents
};

// The highest frequency in a run.
inline constexpr uint32_t kMostScannedFrequency = 0x7f;

// Moves `next` past up to `count` postings with frequencies (postings.h) and returns their sums. It stops before a
// number that is not written in the shortest way, a distance of 0 or of more than three bytes, and a frequency of more
// than one byte. With the baseline's instructions it passes none.
PostingsRun PassPostingsWide(const uint8_t*& next, const uint8_t* end, int32_t count);
inline PostingsRun PassPostings(ScanInstructions instructions, const uint8_t*& next, const uint8_t* end,
                                int32_t count) {
  return instructions == ScanInstructions::kWide ? PassPostingsWide(next, end, count) : PostingsRun();
}

}  // namespace vantrel::elastic::format
