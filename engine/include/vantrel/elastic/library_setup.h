#pragma once

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// Makes the index library (Lucene++) take paths as UTF-8 in every locale, an invalid one included, and not
// pause over a torn segments.gen. To be called before the library is given a path, and before other threads
// start: it changes the environment for a moment. Calling it again does nothing. Where nobody has called it, the first
// use of an index by this library does.
VANTREL_ELASTIC_EXPORT void PrepareIndexLibrary();

}  // namespace vantrel::elastic
