#pragma once

#include <lucene++/Lucene.h>

#include <functional>
#include <string>

// Opens the index in a folder read-only through the index library. Nothing needs to be closed: dropping the
// last reference releases it. What the library throws passes on.
Lucene::IndexReaderPtr OpenIndexReader(const std::string& path);

// Runs the body of an action that ends normally whatever happens: an exception of the index library is
// reported on the wide standard output, any other standard exception on standard output.
void ReportLuceneErrors(const std::function<void()>& body);
