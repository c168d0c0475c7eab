#include "vantrel/elastic/checked_reader.h"

#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermFreqVector.h>
#include <lucene++/TermPositions.h>

#include <optional>
#include <vector>

#include "elastic/common/text.h"
#include "elastic/lookup/library_error.h"
#include "elastic/lookup/opened_segment.h"
#include "elastic/lookup/positions_lookup.h"
#include "elastic/lookup/reading_directory.h"
#include "elastic/lookup/vector_lookup.h"
#include "vantrel/elastic/library_setup.h"

namespace vantrel::elastic {
namespace {

// Not by the library, which stops at one code point; UTF-8 sorts as code points do, be they what they may.
std::string ToUtf8(const Lucene::String& text) {
  std::string bytes;
  for (const wchar_t character : text) AppendUtf8(static_cast<char32_t>(character), bytes);
  return bytes;
}

template <typename Check>
auto RunCheck(Check check) {
  try {
    return check();
  } catch (const IndexError& error) {
    lookup::ThrowAsLibrary(error);
  }
}

}  // namespace

struct CheckedReader::Opened {
  std::optional<lookup::WantedTerm> term;
  std::vector<lookup::OpenedSegment> segments;
};

CheckedReader::CheckedReader(const std::string& path, const Lucene::TermPtr& term)
    : term_(term), opened_(std::make_unique<Opened>()) {
  opened_->term = {ToUtf8(term->field()), ToUtf8(term->text())};
  Open(path);
}

CheckedReader::CheckedReader(const std::string& path) : opened_(std::make_unique<Opened>()) { Open(path); }

CheckedReader::~CheckedReader() = default;

void CheckedReader::Open(const std::string& path) {
  PrepareIndexLibrary();
  constexpr bool kReadOnly = true;
  constexpr int32_t kTermInfosIndexDivisor = 1;
  // A writer may drop a commit while it is being opened, and the library passes over a term vector file that
  // is gone. What is still the newest commit once it is open was opened whole.
  constexpr int kAttempts = 20;
  const auto directory = Lucene::newLucene<lookup::ReadingDirectory>(path, opened_->term);
  for (int attempt = 1;; ++attempt) {
    reader_ = Lucene::IndexReader::open(directory, Lucene::IndexDeletionPolicyPtr(), kReadOnly,
                                        kTermInfosIndexDivisor);
    opened_->segments = directory->TakeSegments();
    if (attempt == kAttempts || reader_->isCurrent()) return;
  }
}

Lucene::TermPositionsPtr CheckedReader::Positions(int32_t document) const {
  if (!opened_->term.has_value()) {
    boost::throw_exception(Lucene::IllegalStateException(L"the reader was opened without a term"));
  }
  RunCheck([&] { lookup::CheckPositionsLookup(opened_->segments, *opened_->term, document); });
  return reader_->termPositions(term_);
}

Lucene::TermFreqVectorPtr CheckedReader::TermVector(int32_t document, const Lucene::String& field) const {
  // The library reads outside its tables for the one, and asks a segment that is not there for the other.
  if (document < 0 || reader_->maxDoc() == 0) return {};
  const auto lookup =
      RunCheck([&] { return lookup::CheckVectorLookup(opened_->segments, ToUtf8(field), document); });
  if (lookup == lookup::VectorLookup::kPastEnd) boost::throw_exception(Lucene::IOException(L"Read past EOF"));
  return reader_->getTermFreqVector(document, field);
}

}  // namespace vantrel::elastic
