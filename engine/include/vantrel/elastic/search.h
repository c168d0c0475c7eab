#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/json_value.h"
#include "vantrel/elastic/search_plugin.h"

namespace vantrel::elastic {

class Index;

// How much one search may ask for. LimitExceededError::limit() is the name of the member.
struct SearchLimits {
  size_t query_bytes = size_t{16} << 10;  // the query string, in UTF-8
  size_t query_depth = 64;                // parentheses within parentheses
  size_t query_clauses = 1024;            // terms looked up, each field of a word without a field counted
  size_t query_expansions = 32;     // of these, the ones that walk a dictionary: prefixes, wildcards, ...
  size_t pattern_characters = 256;  // one prefix, wildcard or fuzzy term
  size_t near_words = 16;  // of a phrase with a distance: their places are tried one against all others
  size_t window = 10'000;  // from + size
  size_t filters = 16;     // in one request
  size_t filter_values = 65'536;           // in one filter
  size_t indexes = 64;                     // searched at once
  size_t result_bytes = size_t{32} << 20;  // stored values of all hits together
};

// Keeps the documents that the filter of a search plugin lets through.
struct SearchFilter {
  std::string plugin;  // with an empty name, it is no filter
  JsonValue data;
};

// The query string is what the index library's query parser takes:
//
//   word  "a phrase"  "near words"~5  field:word  field:"a phrase"  *:*  field:*
//   pre*  wil?c*d  *end  fuzzy~  fuzzy~0.7  field:[from TO to]  field:{from TO to}  [* TO to]
//   +must  -mustnot  NOT a  a AND b  a OR b  (groups)  word^2.5  \+ an escaped character
//
// Words side by side are alternatives: the more of them a document holds, the better it scores. What has no
// field is looked for in every text field; in an index without any, in every keyword. Words and phrases are
// analysed as the field's texts are; patterns and range bounds over a text field are only lower-cased. A value of
// a keyword field is taken as it is; it needs quotes or escapes where it holds blanks or marks of the syntax.
// A pattern may begin with * or ?, and walks the whole dictionary of the field then. Where a field has
// pre-processors, words, phrases and values go through them too; of patterns and bounds just the case is changed.
struct SearchRequest {
  std::string query;  // UTF-8
  uint64_t from = 0;  // hits passed over
  uint64_t size = 10;
  std::vector<SearchFilter> filters;                    // all of them have to let a document through
  std::optional<std::vector<std::string>> load_fields;  // stored fields to hand back; when nothing, all

  // When the search gives up, counted from its begin; 0 is never. It is looked at while dictionaries and the
  // documents of their terms are walked, also by the filters of plugins, and while hits are loaded.
  std::chrono::milliseconds time_limit{0};
};

// The stored values of one field of a document, in the order they were added.
struct FieldValues {
  std::string name;
  std::vector<std::string> values;
};

// A document that was found.
struct SearchHit {
  size_t index = 0;  // which of the searched indexes it is from, counted from 0
  std::string id;    // empty where the document was added without one
  double score = 0;
  std::vector<FieldValues> fields;  // the loaded ones that the document has, in the settings' order
};

// What a search has found.
struct SearchResult {
  uint64_t total = 0;           // documents found
  double max_score = 0;         // of all of them; 0 where there is none
  std::string query;            // as it was understood by the first of the indexes
  std::vector<SearchHit> hits;  // the window [from, from + size) of what was found, best first
  // What may not be as meant, one line each, such as a field that is not there.
  std::vector<std::string> warnings;
};

// Searches several indexes, none of them null, as if they were one: what a word weighs is counted over all of
// them. Equal scores come in the order of the indexes, and of adding. Each index is seen as of its newest commit,
// which this or another process made; what is not committed is not seen. Each index understands the query by its
// own settings. Any number of threads may search, also while others write.
//
// Throws QuerySyntaxError, LimitExceededError, UnknownPluginError, PluginDataError, SearchTimeoutError (all
// SearchError), and IndexError where an index cannot be read.
VANTREL_ELASTIC_EXPORT SearchResult
SearchIndexes(const std::vector<std::shared_ptr<Index>>& indexes, const SearchRequest& request,
              const SearchPluginRegistry& plugins = SearchPluginRegistry::BuiltIn(),
              const SearchLimits& limits = SearchLimits());

}  // namespace vantrel::elastic
