#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace wordnet {

// One set of synonyms of the WordNet database.
struct Synset {
  std::string id;                   // the part of speech's letter and the offset, such as "n00001740"
  std::string part_of_speech;       // noun, verb, adjective, adverb
  std::vector<std::string> lemmas;  // with blanks between the words of a phrase
  std::string gloss;                // a definition and examples
};

// Reads a line of a data file:
//
//   offset file type count(hex) (word id)... pointers and frames | gloss
//
// `letter` is the part of speech's: n, v, a or r. Throws std::runtime_error where the line is no such thing.
Synset ParseSynset(std::string_view line, char letter);

// Reads data.noun, data.verb, data.adj and data.adv of a folder. Throws std::runtime_error, which names the
// file and the line, where one is missing or makes no sense.
std::vector<Synset> ReadSynsets(const std::string& folder);

}  // namespace wordnet
