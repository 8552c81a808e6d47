#pragma once

#include <cerrno>

// What is raised when the filesystem refuses something: the bare error number of the failed call.
// No handler looks at it; the line printed where it arose has told the cause.
using filesystem_error = int;

// Raised for a condition that has no error number.
constexpr filesystem_error no_error_number = -1;

// Raises `error`. The current error number becomes `error` again, which the warning printed just
// before may have changed, so that the catcher's own line ends in the same cause.
[[noreturn]] inline void raise_filesystem_error(filesystem_error error) {
  errno = error;
  throw error;
}
