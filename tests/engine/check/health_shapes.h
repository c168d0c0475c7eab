#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "support/varied_index.h"

namespace quorelastic::testing {

// A small index of a kind of its own.
struct HealthShape {
  const char* name;
  VariedIndexShape index = {};
  const char* older_layout = nullptr;  // what the writer of older layouts is told instead
};

// What the test runner shows of it.
inline void PrintTo(const HealthShape& shape, std::ostream* out) { *out << shape.name; }

inline const std::vector<HealthShape>& HealthShapes() {
  static const std::vector<HealthShape> kShapes = {
      {"Plain",
       {.seed = 11,
        .documents = 18,
        .documents_per_segment = 30,
        .compound = false,
        .compound_store = false}},
      {"Compound", {.seed = 12, .documents = 18, .documents_per_segment = 30, .term_index_interval = 3}},
      {"SharedPlainStores",
       {.seed = 13, .documents = 20, .documents_per_segment = 7, .compound = false, .compound_store = false}},
      {"SharedCompoundStores", {.seed = 14, .documents = 20, .documents_per_segment = 7}},
      {"Deletions",
       {.seed = 15,
        .documents = 24,
        .documents_per_segment = 12,
        .documents_per_commit = 12,
        .compound = false,
        .deletions = 7,
        .term_index_interval = 4}},
      {"OwnNorms",
       {.seed = 16,
        .documents = 20,
        .documents_per_segment = 30,
        .compound = false,
        .compound_store = false,
        .changed_norms = 4}},
      {"OwnNormsBesideCompound",
       {.seed = 17, .documents = 20, .documents_per_segment = 30, .changed_norms = 3}},
      {"SkipData",
       {.seed = 18,
        .documents = 300,
        .documents_per_segment = 400,
        .compound = false,
        .compound_store = false}},
      {"BareFields",
       {.seed = 19,
        .documents = 40,
        .documents_per_segment = 50,
        .compound = false,
        .compound_store = false,
        .term_index_interval = 5,
        .only_bare_fields = true}},
      {"WithoutPayloads",
       {.seed = 20, .documents = 20, .documents_per_segment = 50, .compound = false, .payloads = false}},
      {"OlderPlain", {}, "plain 40 9"},
      {"OlderCompound", {}, "compound 40 9"}};
  return kShapes;
}

}  // namespace quorelastic::testing
