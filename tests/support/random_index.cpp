#include "support/random_index.h"

#include <random>
#include <vector>

#include "support/library_index.h"

namespace quorelastic::testing {
namespace {

using Vector = LibraryField::Vector;

class RandomWords {
 public:
  explicit RandomWords(uint32_t seed) : random_(seed) {}

  // Below `bound`; not by a distribution of the standard library, which differs between implementations.
  uint32_t Below(uint32_t bound) { return static_cast<uint32_t>(random_()) % bound; }

  // Few short words are frequent, long ones rare; many share a beginning.
  std::string Word() {
    static const std::vector<std::string> kPieces = {"a",
                                                     "b",
                                                     "an",
                                                     "the",
                                                     "pre",
                                                     "x",
                                                     "07",
                                                     "-",
                                                     "\xc3\xa4",
                                                     "\xc3\xb8",
                                                     "\xce\xbb",
                                                     "\xd0\xb6",
                                                     "Z",
                                                     "zz",
                                                     "\xe4\xb8\xad",
                                                     "\xe6\x96\x87",
                                                     "\xef\xbf\xbd",
                                                     "\xf0\x9f\x98\x80",
                                                     "_",
                                                     "o",
                                                     "\xf0\x9d\x94\xb8"};
    std::string word;
    const uint32_t length = 1 + Below(1 + Below(1 + Below(12)));
    for (uint32_t i = 0; i < length; ++i) word += kPieces[Below(static_cast<uint32_t>(kPieces.size()))];
    return Below(200) == 0 ? word + std::string(300, 'q') + word : word;
  }

  std::string Words(uint32_t most) {
    std::string text;
    for (uint32_t left = Below(most + 1); left > 0; --left) text += Word() + (Below(9) == 0 ? "  " : " ");
    return text;
  }

 private:
  std::mt19937 random_;
};

std::vector<LibraryField> RandomDocument(RandomWords& words, int number, int documents_per_segment) {
  std::vector<LibraryField> document = {
      {.name = "id", .value = std::to_string(number), .keyword = true, .norms = false},
      {.name = "segment", .value = std::to_string(number / documents_per_segment), .keyword = true},
      {.name = "body", .value = words.Words(20)}};
  if (words.Below(2) == 0)
    document.push_back({.name = "tags", .value = words.Words(5), .frequencies = false});
  if (words.Below(3) == 0)
    document.push_back({.name = "k\xc3\xb6rper", .value = words.Word(), .keyword = true});
  if (words.Below(4) == 0) document.push_back({.name = "bare", .value = words.Words(3), .norms = false});
  if (words.Below(4) == 0) document.push_back({.name = "empty", .value = "", .keyword = words.Below(2) == 0});
  if (words.Below(2) == 0) {
    const auto vector = static_cast<Vector>(words.Below(5));
    document.push_back({.name = "\xe6\x96\x87", .value = words.Words(8), .stored = false, .vector = vector});
  }
  if (words.Below(9) == 0) document.push_back({.name = "field" + words.Word(), .value = words.Word()});
  return document;
}

}  // namespace

void WriteRandomIndex(const std::string& path, const RandomIndexShape& shape) {
  RandomWords words(shape.seed);
  LibraryIndex index(path, {.compound = shape.compound,
                            .documents_per_segment = shape.documents_per_segment,
                            .term_index_interval = shape.term_index_interval});
  for (int number = 0; number < shape.documents; ++number) {
    index.Add(RandomDocument(words, number, shape.documents_per_segment));
  }
  index.Commit();
  if (shape.optimize) index.Optimize();
  for (int i = 0; i < shape.deletions; ++i) {
    if (words.Below(3) == 0) {
      index.Delete("body", words.Word());
    } else {
      index.Delete("id", std::to_string(words.Below(static_cast<uint32_t>(shape.documents))));
    }
  }
  if (shape.delete_segment) index.Delete("segment", "0");
}

}  // namespace quorelastic::testing
