#include "elastic/reading/reading_directory.h"

#include <lucene++/FileUtils.h>
#include <lucene++/NoLockFactory.h>

#include <utility>

#include "elastic/index/path_codecvt.h"
#include "elastic/reading/library_error.h"
#include "elastic/reading/source_input.h"

namespace vantrel::elastic::reading {

// The library makes a name for a lock of the path that it is constructed with, and its digest copies over its own
// bytes for some lengths. Nobody asks for that name: so it is given another path first, and what it would have looked
// for is looked for here.
ReadingDirectory::ReadingDirectory(const std::string& path, std::optional<WantedTerm> term)
    : SimpleFSDirectory(L"/", Lucene::NoLockFactory::getNoLockFactory()),
      path_(path),
      check_(std::move(term)) {
  directory = ToWidePath(path);
  if (Lucene::FileUtils::fileExists(directory) && !Lucene::FileUtils::isDirectory(directory)) {
    boost::throw_exception(
        Lucene::NoSuchDirectoryException(L"File '" + directory + L"' exists but is not a directory"));
  }
}

Lucene::IndexInputPtr ReadingDirectory::openInput(const Lucene::String& name) {
  return openInput(name, Lucene::BufferedIndexInput::BUFFER_SIZE);
}

Lucene::IndexInputPtr ReadingDirectory::openInput(const Lucene::String& name, int32_t /*buffer_size*/) {
  ensureOpen();
  const std::string own_name = Lucene::StringUtils::toUTF8(name);
  const auto source = Open(own_name);
  try {
    check_.Check(own_name, source);
  } catch (const IndexError& error) {
    ThrowAsLibrary(error);
  }
  return Lucene::newLucene<SourceInput>(source);
}

std::shared_ptr<const format::ByteSource> ReadingDirectory::Open(const std::string& name) {
  try {
    if (!folder_.has_value()) folder_.emplace(path_);
    return folder_->Open(name);
  } catch (const IndexError& error) {
    ThrowAsNotFound(error);
  }
}

}  // namespace vantrel::elastic::reading
