#pragma once

#include <lucene++/LuceneHeaders.h>

#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// Whether the values of a field, and words looked for in it, are cut into terms at all.
bool IsAnalyzed(const FieldSettings& field);

// How the values of an index's fields become terms, the same for indexing and for queries: texts are cut into words
// (text_analyzer.h), keywords are left whole, and what comes of that goes through the field's pre-processors. The
// settings have passed CheckSettings.
Lucene::AnalyzerPtr NewFieldAnalyzer(const IndexSettings& settings);

}  // namespace vantrel::elastic
