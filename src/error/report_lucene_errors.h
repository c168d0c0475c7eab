#pragma once

#include <functional>

// Runs the body of an action that ends normally whatever happens: an exception of the index library is
// reported on the wide standard output, any other standard exception on standard output.
void ReportLuceneErrors(const std::function<void()>& body);
