// A library that leaves an error behind before main begins.

#include <cerrno>

namespace {

__attribute__((constructor)) void LeaveError() { errno = EDOM; }

}  // namespace
