#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/SimpleFSDirectory.h>

#include <string>

namespace vantrel::elastic {

// The index library's directory for a path of any bytes, without a lock factory. Throws the library's own
// NoSuchDirectoryException where there is a file of that path. PrepareIndexLibrary() must have been called.
class BytePathDirectory : public Lucene::SimpleFSDirectory {
 protected:
  explicit BytePathDirectory(const std::string& path);
};

}  // namespace vantrel::elastic
