#include "elastic/lookup/reading_directory.h"

#include <utility>

#include "elastic/format/commit/file_names.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/lookup/library_error.h"
#include "elastic/lookup/source_input.h"

namespace vantrel::elastic::lookup {

ReadingDirectory::ReadingDirectory(const std::string& path, std::optional<WantedTerm> term)
    : BytePathDirectory(path), path_(path), check_(std::move(term)) {}

Lucene::IndexInputPtr ReadingDirectory::openInput(const Lucene::String& name) {
  return openInput(name, Lucene::BufferedIndexInput::BUFFER_SIZE);
}

Lucene::IndexInputPtr ReadingDirectory::openInput(const Lucene::String& name, int32_t /*buffer_size*/) {
  ensureOpen();
  const std::string own_name = Lucene::StringUtils::toUTF8(name);
  if (refusal_.has_value()) ThrowAsNotFound(*refusal_);
  const auto source = Open(own_name);
  try {
    check_.Check(own_name, source);
  } catch (const IndexError& error) {
    NoteRefusal(own_name, error);
    ThrowAsLibrary(error);
  }
  return Lucene::newLucene<SourceInput>(source);
}

std::shared_ptr<const format::ByteSource> ReadingDirectory::Open(const std::string& name) {
  try {
    if (!folder_.has_value()) folder_.emplace(path_);
    return folder_->Open(name);
  } catch (const IndexError& error) {
    NoteRefusal(name, error);
    ThrowAsNotFound(error);
  }
}

void ReadingDirectory::NoteRefusal(const std::string& name, const IndexError& error) {
  const auto* const problem = dynamic_cast<const IndexIoError*>(&error);
  if (problem == nullptr || format::IsAbsenceError(*problem) || name == format::kSegmentsGen) return;
  refusal_ = *problem;
}

}  // namespace vantrel::elastic::lookup
