#include "elastic/index/text_analyzer.h"

// Not without the index library's main header.
#include <lucene++/StandardTokenizer.h>
#include <lucene++/TermAttribute.h>

#include <limits>

namespace vantrel::elastic {
namespace {

constexpr auto kLibraryVersion = Lucene::LuceneVersion::LUCENE_30;
constexpr int32_t kValueGap = 100;

class TextAnalyzer : public Lucene::StandardAnalyzer {
 public:
  TextAnalyzer() : StandardAnalyzer(kLibraryVersion, Lucene::HashSet<Lucene::String>::newInstance()) {
    setMaxTokenLength(static_cast<int32_t>(kMostWordCharacters));
  }

  int32_t getPositionIncrementGap(const Lucene::String& /*field*/) override { return kValueGap; }
};

// No word holds a blank: what has no long run without one needs no closer look.
bool HasLongRun(const std::wstring& text) {
  size_t run = 0;
  for (const wchar_t character : text) {
    run = character == L' ' || character == L'\n' ? 0 : run + 1;
    if (run > kMostWordCharacters) return true;
  }
  return false;
}

}  // namespace

Lucene::AnalyzerPtr NewTextAnalyzer() { return Lucene::newLucene<TextAnalyzer>(); }

size_t FindTooLongWord(const std::wstring& text) {
  if (!HasLongRun(text)) return 0;
  const auto words = Lucene::newLucene<Lucene::StandardTokenizer>(
      kLibraryVersion, Lucene::newLucene<Lucene::StringReader>(text));
  words->setMaxTokenLength(std::numeric_limits<int32_t>::max());
  const auto word = words->getAttribute<Lucene::TermAttribute>();
  while (words->incrementToken()) {
    const auto length = static_cast<size_t>(word->termLength());
    if (length > kMostWordCharacters) return length;
  }
  return 0;
}

}  // namespace vantrel::elastic
