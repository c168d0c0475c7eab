#pragma once

#include <lucene++/Lucene.h>

#include <string>

// Opens the index in a folder read-only through the index library. Nothing needs to be closed: dropping the
// last reference releases it. What the library throws passes on.
Lucene::IndexReaderPtr OpenIndexReader(const std::string& path);
