#pragma once

#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {

// A file of a segment is not there, or may not be opened. what() and path() are those of the failed opening.
class FileMissingError : public IndexError {
 public:
  using IndexError::IndexError;
};

// Whether the index can be blamed for a failed opening. Anything else (no memory, no more open files, a failing disk)
// says nothing about it.
bool IsMissingError(const IndexIoError& error);

// Whether a failed opening means that there is no such file: none of that name, or something else in its place.
bool IsAbsenceError(const IndexIoError& error);
bool IsAbsence(int error_number);

// A failed opening for which the index can be blamed.
FileMissingError AsMissing(const IndexError& error);

// Throws a failed opening on: as FileMissingError where the index can be blamed for it, else as it is.
[[noreturn]] void RethrowOpening(const IndexError& error);

}  // namespace vantrel::elastic::format
