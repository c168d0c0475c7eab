#include "elastic/format/io/wide_scan.h"

#include <bit>
#include <cstring>

#if defined(__x86_64__)
#include <immintrin.h>
// Compiles a function for these instructions; the rest of the program does not need them.
#define QUORELASTIC_WIDE __attribute__((target("avx2,bmi,bmi2,popcnt")))
#endif

namespace vantrel::elastic::format {
namespace {

// In a mask of a step, the lowest bit stands for the first byte. This one selects the bytes up to number `bit`.
constexpr uint64_t UpTo(int bit) { return (uint64_t{2} << bit) - 1; }

// The bytes that announce a fourth one.
constexpr uint64_t FourthBytes(uint64_t high_bits) { return high_bits & high_bits << 1 & high_bits << 2; }

#if defined(__x86_64__)

uint64_t HighBits(const uint8_t* bytes) {
  uint64_t bits = 0;
  for (size_t i = 0; i < kScanStep; i += 16) {
    const __m128i piece = _mm_loadu_si128(reinterpret_cast<const __m128i*>(bytes + i));
    bits |= uint64_t{static_cast<uint32_t>(_mm_movemask_epi8(piece))} << i;
  }
  return bits;
}

#else

uint64_t HighBits(const uint8_t* bytes) {
  uint64_t bits = 0;
  for (size_t i = 0; i < kScanStep; ++i) bits |= uint64_t{bytes[i]} >> 7 << i;
  return bits;
}

#endif

}  // namespace

bool PassShortVIntsBaseline(const uint8_t*& next, const uint8_t* end, uint64_t& count) {
  while (count > 0 && end - next >= static_cast<ptrdiff_t>(kScanStep)) {
    const uint64_t more = HighBits(next);
    uint64_t ends = ~more;
    const auto ended = static_cast<uint64_t>(std::popcount(ends));
    if (ended <= count) {
      if (ended == 0 || FourthBytes(more) != 0) return false;
      count -= ended;
      next += kScanStep - static_cast<size_t>(std::countl_zero(ends));
      continue;
    }
    while (--count > 0) ends &= ends - 1;
    const int last = std::countr_zero(ends);
    if ((FourthBytes(more) & UpTo(last)) != 0) return false;
    next += last + 1;
  }
  return true;
}

#if defined(__x86_64__)
namespace {

struct Step {
  __m256i low;
  __m256i high;
};

QUORELASTIC_WIDE inline Step LoadStep(const uint8_t* bytes) {
  return {_mm256_loadu_si256(reinterpret_cast<const __m256i*>(bytes)),
          _mm256_loadu_si256(reinterpret_cast<const __m256i*>(bytes + 32))};
}

// The highest bits of the bytes.
QUORELASTIC_WIDE inline uint64_t BitsOf(__m256i low, __m256i high) {
  const auto first = static_cast<uint32_t>(_mm256_movemask_epi8(low));
  const auto second = static_cast<uint32_t>(_mm256_movemask_epi8(high));
  return first | uint64_t{second} << 32;
}

QUORELASTIC_WIDE inline uint64_t EqualTo(const Step& step, char value) {
  const __m256i wanted = _mm256_set1_epi8(value);
  return BitsOf(_mm256_cmpeq_epi8(step.low, wanted), _mm256_cmpeq_epi8(step.high, wanted));
}

// The n-th bit that is set, counted from 0.
QUORELASTIC_WIDE inline int BitNumber(uint64_t bits, uint64_t n) {
  return static_cast<int>(_tzcnt_u64(_pdep_u64(uint64_t{1} << n, bits)));
}

}  // namespace

QUORELASTIC_WIDE bool PassShortVIntsWide(const uint8_t*& next, const uint8_t* end, uint64_t& count) {
  while (count > 0 && end - next >= static_cast<ptrdiff_t>(kScanStep)) {
    const Step step = LoadStep(next);
    const uint64_t more = BitsOf(step.low, step.high);
    const uint64_t ends = ~more;
    const auto ended = static_cast<uint64_t>(_mm_popcnt_u64(ends));
    if (ended <= count) {
      if (ended == 0 || FourthBytes(more) != 0) return false;
      count -= ended;
      next += kScanStep - static_cast<size_t>(std::countl_zero(ends));
      continue;
    }
    const int last = BitNumber(ends, count - 1);
    if ((FourthBytes(more) & UpTo(last)) != 0) return false;
    count = 0;
    next += last + 1;
  }
  return true;
}

namespace {

// Replaces each of 32 bytes whose bit is not set by 0.
QUORELASTIC_WIDE inline __m256i Selected(__m256i bytes, uint32_t bits) {
  const __m256i byte_of_bit =
      _mm256_setr_epi64x(0x0000000000000000, 0x0101010101010101, 0x0202020202020202, 0x0303030303030303);
  const __m256i bit_in_byte = _mm256_set1_epi64x(static_cast<int64_t>(0x8040201008040201U));
  const __m256i spread = _mm256_shuffle_epi8(_mm256_set1_epi32(static_cast<int>(bits)), byte_of_bit);
  const __m256i is_set = _mm256_cmpeq_epi8(_mm256_and_si256(spread, bit_in_byte), bit_in_byte);
  return _mm256_and_si256(bytes, is_set);
}

// The sum of the selected bytes of each of four lanes. It takes 12 bits.
QUORELASTIC_WIDE inline __m256i SumsOf(const Step& step, uint64_t bits) {
  const __m256i zero = _mm256_setzero_si256();
  const __m256i low = _mm256_sad_epu8(Selected(step.low, static_cast<uint32_t>(bits)), zero);
  const __m256i high = _mm256_sad_epu8(Selected(step.high, static_cast<uint32_t>(bits >> 32)), zero);
  return _mm256_add_epi64(low, high);
}

QUORELASTIC_WIDE inline uint64_t AddLanes(__m256i lanes) {
  const __m128i halves = _mm_add_epi64(_mm256_castsi256_si128(lanes), _mm256_extracti128_si256(lanes, 1));
  return static_cast<uint64_t>(_mm_cvtsi128_si64(_mm_add_epi64(halves, _mm_unpackhi_epi64(halves, halves))));
}

// Which numbers are frequencies. Each bit stands for a number; in `even` it is set where the number is even. A frequency
// follows an even number that is not itself a frequency: every second number of a run of even ones is one, and the
// number behind the run where the run's length is odd. The carry of the subtraction passes through a whole run.
constexpr uint64_t FrequenciesAmong(uint64_t even) {
  constexpr uint64_t kOddPlaces = 0xaaaaaaaaaaaaaaaa;
  return (((even << 1 | kOddPlaces) - even) ^ kOddPlaces) ^ even;
}

}  // namespace

QUORELASTIC_WIDE PostingsRun PassPostingsWide(const uint8_t*& next, const uint8_t* end, int32_t count) {
  PostingsRun run;
  const __m256i low_bits = _mm256_set1_epi8(0x7f);
  while (run.documents < count && end - next >= static_cast<ptrdiff_t>(kScanStep)) {
    const Step step = LoadStep(next);
    const uint64_t more = BitsOf(step.low, step.high);
    const uint64_t odd = BitsOf(_mm256_slli_epi16(step.low, 7), _mm256_slli_epi16(step.high, 7));
    const uint64_t starts = ~more << 1 | 1;
    const uint64_t even_numbers = _pext_u64(~odd, starts);
    const uint64_t frequency_numbers = FrequenciesAmong(even_numbers);
    const uint64_t frequencies = _pdep_u64(frequency_numbers, starts);
    const uint64_t document_ends = _pdep_u64(~even_numbers | frequency_numbers, ~more);

    const auto wanted = static_cast<uint32_t>(count - run.documents);
    const auto complete = static_cast<uint32_t>(_mm_popcnt_u64(document_ends));
    if (complete == 0) break;
    const uint32_t passed = wanted < complete ? wanted : complete;
    const int last = BitNumber(document_ends, passed - 1);
    const uint64_t mask = UpTo(last);

    // Left to the slow path: a fourth byte; a frequency of two bytes; a byte of 0 (a frequency or a distance of 0, or a
    // number that could be shorter); a number of 1 in one byte (a distance of 0, or a frequency that is needless).
    const uint64_t refused =
        FourthBytes(more) | (frequencies & more) | EqualTo(step, 0) | (EqualTo(step, 1) & starts);
    if ((refused & mask) != 0) break;

    const Step plain{_mm256_and_si256(step.low, low_bits), _mm256_and_si256(step.high, low_bits)};
    // The shift moves a bit of the neighbouring byte in, which the mask clears.
    const __m256i six_bits = _mm256_set1_epi8(0x3f);
    const Step halves{_mm256_and_si256(_mm256_srli_epi16(step.low, 1), six_bits),
                      _mm256_and_si256(_mm256_srli_epi16(step.high, 1), six_bits)};
    const uint64_t seconds = (starts & more) << 1;
    const __m256i first_sums = SumsOf(halves, starts & ~frequencies & mask);
    const __m256i second_sums = SumsOf(plain, seconds & mask);
    const __m256i frequency_sums = SumsOf(plain, frequencies & mask);
    const uint64_t sums =
        AddLanes(_mm256_or_si256(first_sums, _mm256_or_si256(_mm256_slli_epi64(second_sums, 16),
                                                             _mm256_slli_epi64(frequency_sums, 32))));
    run.distance += (sums & 0xffff) + (sums >> 16 & 0xffff) * 64;
    const uint64_t thirds = (seconds & more) << 1 & mask;
    if (thirds != 0) run.distance += AddLanes(SumsOf(plain, thirds)) << 13;
    const auto stated = static_cast<uint64_t>(_mm_popcnt_u64(frequencies & mask));
    run.occurrences += (sums >> 32) + passed - stated;
    run.documents += static_cast<int32_t>(passed);
    next += last + 1;
  }
  return run;
}

#endif

ScanInstructions FindBestScanInstructions() {
#if defined(__x86_64__)
  // The first two generations of AMD's Zen have BMI2, but take hundreds of cycles for PDEP and PEXT.
  const bool is_wide = __builtin_cpu_supports("avx2") != 0 && __builtin_cpu_supports("bmi") != 0 &&
                       __builtin_cpu_supports("bmi2") != 0 && __builtin_cpu_supports("popcnt") != 0 &&
                       __builtin_cpu_is("znver1") == 0 && __builtin_cpu_is("znver2") == 0;
  if (is_wide) return ScanInstructions::kWide;
#endif
  return ScanInstructions::kBaseline;
}

#if !defined(__x86_64__)
bool PassShortVIntsWide(const uint8_t*& next, const uint8_t* end, uint64_t& count) {
  return PassShortVIntsBaseline(next, end, count);
}

PostingsRun PassPostingsWide(const uint8_t*& /*next*/, const uint8_t* /*end*/, int32_t /*count*/) {
  return {};
}
#endif

}  // namespace vantrel::elastic::format
