#pragma once

#include <string>

namespace quorelastic::testing {

// Indexes whose files are short enough to be known by heart, so that a test can change one value in them.

// Three documents of one field with vectors, the last one deleted. Not as a compound file it has
//
//   .fnm  VInt -2 (5 bytes), 1 field; at 6 the name "body", at 11 the flags
//   .tis  24 bytes of header; at 24 "alpha" (its field number at 31), at 35 "beta", at 45 "gamma"
//   .tii  24 bytes of header; at 24 the first entry, its field number -1 at 26, its pointer 24 at 34
//   .frq  at 0 "alpha", twice in each of three documents; at 6 "beta", once in each; at 9 "gamma" in the last
//   .fdt  4 bytes of header; at 4 the count of fields, then number, flags, length, text
//   .tvd  4 bytes of header; for each document a count of fields and a field number
//   .tvf  4 bytes of header; at 4 the count of terms, flags, then "alpha": prefix 6, suffix 7, text, frequency 13
void WriteSmallIndex(const std::string& path, bool compound);

// 300 documents that hold one word: two levels of skip data. They stand at 300 in .frq: the length of the upper level,
// its one entry at 301, the lower level from 308 on, three bytes an entry.
void WriteSkippingIndex(const std::string& path);

}  // namespace quorelastic::testing
