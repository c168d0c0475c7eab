#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// What the engine throws when an index cannot be used. what() is one line that begins with the path it is
// about, so that it can be shown to an administrator as it is. Paths are the bytes of the file system.
class VANTREL_ELASTIC_EXPORT IndexError : public std::runtime_error {
 public:
  IndexError(const std::string& path, const std::string& problem);

  // The file or folder in question.
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

// The operating system refused: what is asked for is missing, unreadable or of the wrong kind, the medium failed, no more
// files can be opened. A file of a segment that is not there although the index refers to it is damage instead, a plain
// IndexError, to what goes through the index library (searches, changes); what reads on its own, such as IndexInfo,
// SuggestTerms and Index::Statistics, tells it by this.
class VANTREL_ELASTIC_EXPORT IndexIoError : public IndexError {
 public:
  // `problem` says what could not be done; the text of `error_number` (an errno value) is added to it.
  IndexIoError(const std::string& path, const std::string& problem, int error_number);

  int error_number() const { return error_number_; }

 private:
  int error_number_;
};

// The bytes of an index file contradict its format.
class VANTREL_ELASTIC_EXPORT IndexDamagedError : public IndexError {
 public:
  IndexDamagedError(const std::string& path, uint64_t offset, const std::string& problem);

  // Where in the file the offending value begins, in bytes. Within a compound file, path() names the
  // sub-file in parentheses and the offset counts from the sub-file's first byte.
  uint64_t offset() const { return offset_; }

 private:
  uint64_t offset_;
};

// There is an index already where one is to be created. path() is the folder.
class VANTREL_ELASTIC_EXPORT IndexExistsError : public IndexError {
 public:
  explicit IndexExistsError(const std::string& path);
};

// Somebody else, in this process or another, has the index open for writing. path() is the folder.
class VANTREL_ELASTIC_EXPORT IndexLockedError : public IndexError {
 public:
  explicit IndexLockedError(const std::string& path);
};

// Changes that were made but not committed are gone: dropped when a later one failed, which was told then. Nothing
// else is wrong with the index. path() is the folder.
class VANTREL_ELASTIC_EXPORT IndexChangesLostError : public IndexError {
 public:
  explicit IndexChangesLostError(const std::string& path);
};

// What was handed in cannot be taken: settings that contradict themselves, a document that does not fit the
// settings, a text that is not valid. The index is as it was before the call. path() is the folder.
class VANTREL_ELASTIC_EXPORT IndexValueError : public IndexError {
 public:
  using IndexError::IndexError;
};

}  // namespace vantrel::elastic
