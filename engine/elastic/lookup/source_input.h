#pragma once

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/BufferedIndexInput.h>

#include <cstdint>
#include <memory>

#include "elastic/format/io/byte_source.h"

namespace vantrel::elastic::lookup {

// A file as the index library reads it, out of a source that is open already. Clones share the source and outlive the
// original's close(). A failed read is Lucene::IOException, and names the file.
class SourceInput : public Lucene::BufferedIndexInput {
 public:
  SourceInput() = default;  // of a clone to be
  explicit SourceInput(std::shared_ptr<const format::ByteSource> source);

  int64_t length() override;
  void readBytes(uint8_t* bytes, int32_t offset, int32_t length) override;
  void readBytes(uint8_t* bytes, int32_t offset, int32_t length, bool use_buffer) override;
  void close() override;
  Lucene::LuceneObjectPtr clone(const Lucene::LuceneObjectPtr& other) override;

 protected:
  void readInternal(uint8_t* bytes, int32_t offset, int32_t length) override;
  void seekInternal(int64_t position) override;

 private:
  std::shared_ptr<const format::ByteSource> source_;
};

}  // namespace vantrel::elastic::lookup
