#pragma once

#include <string>

#include "vantrel/elastic/search.h"

namespace vantrel::elastic {

// Looks a query over before the index library's parser gets it: that one recurses with every parenthesis until
// the stack is used up, and does not tell where a mistake is. This reads the library's own tokens, one after
// another, by the same grammar:
//
//   query   = clause { [AND | OR] clause }
//   clause  = [+ | - | NOT] [(word | *) :] (term | "(" query ")" [boost])
//   term    = (word | * | prefix | wildcard | number) [similarity] [boost [similarity]]
//           | phrase [slop] [boost] | range [boost]
//   boost   = ^ number
//
// What passes here the parser takes. Throws QuerySyntaxError; LimitExceededError for query_depth,
// query_clauses and query_expansions, where each term counts once.
void ScanQuery(const std::wstring& query, const SearchLimits& limits);

}  // namespace vantrel::elastic
