#pragma once

#include <array>
#include <cstddef>

namespace quorelasticd {

// What an error reply's "code" can be. The texts are part of the protocol.
enum class ErrorCode {
  kBadRequest,
  kUnknownCommand,
  kIndexNotFound,
  kIndexExists,
  kQuerySyntax,
  kLimitExceeded,
  kUnknownPlugin,
  kLocked,
  kCorrupt,
  kIoError,
  kTimeout,
  kShuttingDown,
  kInternal,  // the last one
};

struct ErrorEntry {
  ErrorCode code;
  const char* text;     // the "code" of a reply
  const char* meaning;  // for people
};

// One entry for every code, in the order of the codes.
inline constexpr std::array kErrorTable = {
    ErrorEntry{
        ErrorCode::kBadRequest, "bad_request",
        "The request is not understood: no JSON object, a member that is missing, unknown or of the wrong "
        "type, a value that cannot be taken. The reason names the member and what was expected."},
    ErrorEntry{ErrorCode::kUnknownCommand, "unknown_command", "There is no command of this name."},
    ErrorEntry{ErrorCode::kIndexNotFound, "index_not_found", "There is no index of this name."},
    ErrorEntry{ErrorCode::kIndexExists, "index_exists", "There is an index of this name already."},
    ErrorEntry{ErrorCode::kQuerySyntax, "query_syntax",
               "The query text cannot be understood. The member \"position\" counts its characters from 0."},
    ErrorEntry{
        ErrorCode::kLimitExceeded, "limit_exceeded",
        "More was asked for than the daemon takes. The member \"limit\" names the limit, \"most\" is what "
        "it allows."},
    ErrorEntry{ErrorCode::kUnknownPlugin, "unknown_plugin", "There is no search plugin of this name."},
    ErrorEntry{
        ErrorCode::kLocked, "locked",
        "The index is in use: by another process that writes to it, or by requests that are still running."},
    ErrorEntry{ErrorCode::kCorrupt, "corrupt", "The index is damaged. The reason names the file."},
    ErrorEntry{
        ErrorCode::kIoError, "io_error",
        "The disk or the operating system refused, or changes have been lost by an earlier failure of that "
        "kind."},
    ErrorEntry{ErrorCode::kTimeout, "timeout", "The request took longer than it may."},
    ErrorEntry{ErrorCode::kShuttingDown, "shutting_down",
               "The daemon is about to end and takes no more requests. Nothing was done."},
    ErrorEntry{ErrorCode::kInternal, "internal",
               "The daemon failed in a way that it should not. Its log says more."},
};

constexpr const char* ToText(ErrorCode code) { return kErrorTable.at(static_cast<size_t>(code)).text; }

}  // namespace quorelasticd
