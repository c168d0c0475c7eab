#include "elastic/lookup/library_error.h"

#include <lucene++/LuceneHeaders.h>

#include <cerrno>

#include "elastic/index/path_codecvt.h"

namespace vantrel::elastic::lookup {

void ThrowAsLibrary(const IndexError& error) {
  const Lucene::String text = ToWidePath(error.what());
  if (dynamic_cast<const IndexDamagedError*>(&error) != nullptr) {
    boost::throw_exception(Lucene::CorruptIndexException(text));
  }
  boost::throw_exception(Lucene::IOException(text));
}

void ThrowAsNotFound(const IndexError& error) {
  // The library would open a folder, and read it forever.
  const auto* const failure = dynamic_cast<const IndexIoError*>(&error);
  const bool is_plain = failure != nullptr && failure->error_number() != EISDIR;
  boost::throw_exception(Lucene::FileNotFoundException(ToWidePath(is_plain ? error.path() : error.what())));
}

}  // namespace vantrel::elastic::lookup
