#pragma once

#include <cstddef>
#include <cstdint>

namespace vantrel::elastic::format {

// Numbers of one to three bytes (VInts, see byte_reader.h), passed many at a time. Nothing is decoded that can be
// counted: each number ends with the one of its bytes that lacks the high bit.

// What the scans use. All of them pass the same bytes.
enum class ScanInstructions {
  kBaseline,  // what every processor of the architecture has
  kWide,      // AVX2 and BMI2, on x86-64
};

// The best that this processor has and is fast at.
ScanInstructions FindBestScanInstructions();
inline ScanInstructions BestScanInstructions() {
  static const ScanInstructions best = FindBestScanInstructions();
  return best;
}

// The scans read this many bytes at a time, and do nothing where fewer are left.
inline constexpr size_t kScanStep = 64;

// Moves `next` past `count` VInts, or as many as whole steps before `end` hold, and takes them off `count`. False where
// a number takes more than three bytes, or may; `next` is then somewhere before it.
bool PassShortVIntsBaseline(const uint8_t*& next, const uint8_t* end, uint64_t& count);
bool PassShortVIntsWide(const uint8_t*& next, const uint8_t* end, uint64_t& count);
inline bool PassShortVInts(ScanInstructions instructions, const uint8_t*& next, const uint8_t* end,
                           uint64_t& count) {
  return instructions == ScanInstructions::kWide ? PassShortVIntsWide(next, end, count)
                                                 : PassShortVIntsBaseline(next, end, count);
}

// What a run of postings adds up to.
struct PostingsRun {
  int32_t documents = 0;
  uint64_t distance = 0;     // from the document before the run to its last one
  uint64_t occurrences = 0;  // of the term in these documents
};

// No document of such a run holds the term more often.
inline constexpr uint32_t kMostScannedFrequency = 0x7f;

// Moves `next` past `count` postings with frequencies (postings.h), or past the first of them, and says what they add
// up to. It passes only what is written in the shortest way, with distances of 1 or more in at most three bytes and
// frequencies of one byte. None with the baseline's instructions.
PostingsRun PassPostingsWide(const uint8_t*& next, const uint8_t* end, int32_t count);
inline PostingsRun PassPostings(ScanInstructions instructions, const uint8_t*& next, const uint8_t* end,
                                int32_t count) {
  return instructions == ScanInstructions::kWide ? PassPostingsWide(next, end, count) : PostingsRun();
}

}  // namespace vantrel::elastic::format
