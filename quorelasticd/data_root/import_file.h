#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "elastic/common/file_descriptor.h"

namespace quorelasticd {

// A file of the import folder, read line by line.
class ImportFile {
 public:
  // `name` is a path below `folder`. Throws RequestError (bad_request) where it leads out of the folder, by ".."
  // or by a symbolic link, and where there is no such regular file; std::system_error where it cannot be read.
  ImportFile(const std::string& folder, const std::string& name);

  struct Line {
    uint64_t number = 0;       // from 1
    std::string_view text;     // without its newline; valid until the next call
    bool is_too_long = false;  // longer than kLongestImportLine: the text is empty
  };

  // The next line, nothing at the end. A last line without a newline counts. Throws std::system_error.
  std::optional<Line> Next();

  // Lets Next() end soon, as at the end of the file, be it within a line of terabytes. For any thread.
  void GiveUp() { is_given_up_ = true; }

  uint64_t bytes_read() const { return bytes_read_; }

  // When the file was opened.
  uint64_t total_bytes() const { return total_bytes_; }

 private:
  bool Fill();

  std::string path_;  // for messages
  vantrel::elastic::FileDescriptor file_;
  std::string buffer_;
  size_t begin_ = 0;  // of what is not handed out yet
  uint64_t bytes_read_ = 0;
  uint64_t total_bytes_ = 0;
  uint64_t lines_ = 0;
  bool at_end_ = false;
  std::atomic<bool> is_given_up_{false};
};

}  // namespace quorelasticd
