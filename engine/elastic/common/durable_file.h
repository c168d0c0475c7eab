#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vantrel::elastic {

// Puts the file `name` into a folder, in place of any before it, so that a reader, and whoever comes after a
// loss of power, finds either the old file or the whole new one. Durable on return. Throws IndexIoError.
void WriteFileDurably(const std::string& folder, const std::string& name, std::string_view bytes);

// Makes the entries of a folder durable: files created, renamed or removed in it. Throws IndexIoError.
void SyncFolder(const std::string& folder);

// Writes all of `bytes` at `offset`, resuming where the system took less or was interrupted. False, with
// errno set, where it failed.
bool WriteFully(int descriptor, std::string_view bytes, uint64_t offset);

}  // namespace vantrel::elastic
