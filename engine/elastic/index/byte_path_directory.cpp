#include "elastic/index/byte_path_directory.h"

// Not without the index library's main header.
#include <lucene++/FileUtils.h>
#include <lucene++/NoLockFactory.h>

#include "elastic/index/path_codecvt.h"

namespace vantrel::elastic {

// The library makes a name for a lock of the path that it is constructed with, and its digest copies over its own
// bytes for some lengths. Nobody asks for that name: so it is given another path first, and what it would have looked
// for is looked for here.
BytePathDirectory::BytePathDirectory(const std::string& path)
    : SimpleFSDirectory(L"/", Lucene::NoLockFactory::getNoLockFactory()) {
  directory = ToWidePath(path);
  if (Lucene::FileUtils::fileExists(directory) && !Lucene::FileUtils::isDirectory(directory)) {
    boost::throw_exception(
        Lucene::NoSuchDirectoryException(L"File '" + directory + L"' exists but is not a directory"));
  }
}

}  // namespace vantrel::elastic
