#pragma once

#include <cstdint>
#include <string>

namespace quorelastic::testing {

// What a varied index is made with; everything else follows from the seed.
struct VariedIndexShape {
  uint32_t seed = 1;
  int documents = 40;
  int documents_per_segment = 12;  // flushed without a commit: such segments share a document store
  int documents_per_commit =
      0;  // a commit gives the segments after it a store of their own; 0: one at the end
  bool compound = true;
  bool compound_store = true;
  bool optimize = false;
  int deletions = 0;      // documents, at random, after all are written
  int changed_norms = 0;  // single norms, at random: their fields get norm files of their own
  int term_index_interval = 128;
  bool payloads = true;
  bool only_bare_fields = false;  // no frequencies, no positions, no norms, no vectors
};

// Writes an index with everything that the index library can write, through it alone: fields with and without norms,
// frequencies and payloads of changing length, term vectors of each kind, stored texts and bytes, words in every
// document and in one, also with several levels of skip data where there are documents enough.
void WriteVariedIndex(const std::string& path, const VariedIndexShape& shape);

// A shape that follows from the seed as well: small, and of any kind.
VariedIndexShape RandomShape(uint32_t seed);

}  // namespace quorelastic::testing
