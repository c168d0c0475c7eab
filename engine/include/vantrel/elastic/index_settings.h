#pragma once

#include <string>
#include <vector>

namespace vantrel::elastic {

enum class FieldType {
  kText,     // cut into words, lower-cased; each word is a term
  kKeyword,  // the value as it is, is the one term
};

// What is kept, beside the postings, about the words of each single document.
enum class TermVector { kNone, kTerms, kPositions, kOffsets, kPositionsAndOffsets };

// A step that the terms of a field go through before they are indexed; a query's words go the same way.
//
//   name       argument
//   "tolower"  none: letters become lower-case
//   "ngram"    lengths, such as "2" or "2,3": every run of so many characters is a term, and a word is found as a
//              phrase of them, so that the field needs its frequencies
struct PreProcSettings {
  std::string name;
  std::string argument;

  bool operator==(const PreProcSettings&) const = default;
};

// How the values of one field are indexed. Settled when the index is created.
struct FieldSettings {
  std::string name;  // valid UTF-8, not empty
  FieldType type = FieldType::kText;
  bool stored = true;  // a search can hand back the value
  TermVector term_vector = TermVector::kNone;
  bool norms = true;  // short values score higher; takes one byte a document
  // How often and where a term stands in a document; without them, no phrase is found.
  bool frequencies = true;
  // What the words of a text or the whole value of a keyword go through, in this order; at most eight. What is
  // stored is not touched. Search plugins compare with the terms as they are indexed. Not for the id field.
  std::vector<PreProcSettings> pre_processors = {};
};

// How an index is made; kept in its folder, in quorelastic.json.
struct IndexSettings {
  std::vector<FieldSettings> fields;  // at least one, no two of one name

  // The field that tells a document from every other, for Update and DeleteById: a stored keyword. Where it is
  // not among the fields of an index to be created, it is put before them.
  std::string id_field = "id";

  bool compound_files = true;  // one file a segment: fewer open files, a little more work to write
};

}  // namespace vantrel::elastic
