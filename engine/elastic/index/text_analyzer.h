#pragma once

#include <lucene++/LuceneHeaders.h>

#include <string>

namespace vantrel::elastic {

// The longest term that the index library keeps, in characters. It drops longer ones silently.
inline constexpr size_t kMostWordCharacters = 16383;

// How texts are cut into terms, the same for indexing and for queries: words are lower-cased by Unicode,
// whatever the locale; numbers and e-mail addresses stay in one piece, CJK ideographs are a term each. The
// library's standard analyzer does that. Its stop words are left out, as they are English ones and the text
// may be in any language. Words are kept up to kMostWordCharacters (the analyzer's own limit of 255 drops what is
// longer). Between two values of one field there is a gap that no phrase spans.
Lucene::AnalyzerPtr NewTextAnalyzer();

// The length of the first word that is longer than kMostWordCharacters, in characters; 0 where there is none.
size_t FindTooLongWord(const std::wstring& text);

}  // namespace vantrel::elastic
