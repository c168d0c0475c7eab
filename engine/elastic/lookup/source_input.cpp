#include "elastic/lookup/source_input.h"

#include <span>
#include <utility>

#include "elastic/lookup/library_error.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::lookup {
namespace {

// Sequential reading of a dictionary's index is most of what the library does; its own 2 KiB take eight times as many
// calls of the system.
constexpr int32_t kBufferSize = 16 << 10;

}  // namespace

SourceInput::SourceInput(std::shared_ptr<const format::ByteSource> source)
    : BufferedIndexInput(kBufferSize), source_(std::move(source)) {}

int64_t SourceInput::length() { return source_ == nullptr ? 0 : static_cast<int64_t>(source_->size()); }

void SourceInput::readBytes(uint8_t* bytes, int32_t offset, int32_t length) {
  BufferedIndexInput::readBytes(bytes, offset, length, true);
}

// A file within a compound one asks not to be buffered here, as it has a buffer of its own; but it is a small one.
void SourceInput::readBytes(uint8_t* bytes, int32_t offset, int32_t length, bool /*use_buffer*/) {
  BufferedIndexInput::readBytes(bytes, offset, length, true);
}

void SourceInput::close() {
  BufferedIndexInput::close();
  source_.reset();
}

Lucene::LuceneObjectPtr SourceInput::clone(const Lucene::LuceneObjectPtr& other) {
  const auto copy = BufferedIndexInput::clone(other ? other : Lucene::newLucene<SourceInput>());
  boost::dynamic_pointer_cast<SourceInput>(copy)->source_ = source_;
  return copy;
}

void SourceInput::readInternal(uint8_t* bytes, int32_t offset, int32_t length) {
  if (source_ == nullptr) boost::throw_exception(Lucene::AlreadyClosedException(L"this file is closed"));
  const int64_t start = getFilePointer();
  if (start < 0 || length < 0 || start > this->length() || length > this->length() - start) {
    boost::throw_exception(Lucene::IOException(L"Read past EOF"));
  }
  try {
    source_->ReadAt(static_cast<uint64_t>(start), std::span(bytes + offset, static_cast<size_t>(length)));
  } catch (const IndexError& error) {
    ThrowAsLibrary(error);
  }
}

void SourceInput::seekInternal(int64_t /*position*/) {}

}  // namespace vantrel::elastic::lookup
