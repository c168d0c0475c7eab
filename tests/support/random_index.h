#pragma once

#include <cstdint>
#include <string>

namespace quorelastic::testing {

// What a random index looks like; everything else about it follows from the seed.
struct RandomIndexShape {
  uint32_t seed = 1;
  int documents = 60;
  int documents_per_segment = 25;
  int deletions = 0;            // how many terms are taken at random, and their documents deleted
  bool delete_segment = false;  // every document of the first segment is deleted
  bool optimize = false;        // before the deletions
  bool compound = true;
  int term_index_interval = 128;
};

// Writes an index of fields of every kind (text and keywords; with vectors, without norms, without frequencies;
// empty values; Latin, Greek, Cyrillic, Chinese and supplementary characters) through the index library alone.
// The same shape always gives the same documents.
void WriteRandomIndex(const std::string& path, const RandomIndexShape& shape);

}  // namespace quorelastic::testing
