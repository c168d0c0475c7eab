#pragma once

#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::lookup {

// Throws what the index library would: Lucene::CorruptIndexException for damage, else Lucene::IOException. Both have
// the error's own text.
[[noreturn]] void ThrowAsLibrary(const IndexError& error);

// The same for a file that could not be opened: as Lucene::FileNotFoundException, with the library's text.
[[noreturn]] void ThrowAsNotFound(const IndexError& error);

}  // namespace vantrel::elastic::lookup
