#pragma once

#include <string>

// What is thrown when the filesystem refuses something: the bare error number of the failed call.
// A number is enough: no handler reads it, as the line printed where it arose has told the cause.
using filesystem_error = int;

// Thrown for a condition that has no error number.
inline constexpr filesystem_error no_error_number = -1;

// Throws `error`, and makes it the current error number again, which the line printed just before
// may have changed. So the line that the catcher prints ends in the same cause.
[[noreturn]] void throw_filesystem_error(filesystem_error error);

// The filesystem operations whose failures are reported alike. Each is one system call on an
// absolute path. When it fails, all but exists() print one line that ends in the call's error, and
// throw that as filesystem_error. Nothing is retried and nothing is undone.
//
// Always called with the namespace written out, as the C library's remove always is with std::.
namespace primitive {

// Like unlink(2), but a missing path is not an error.
// Prints "remove: could not remove PATH" and throws.
void remove(const std::string& path);

// Returns whether `path` leads to something. Links are followed: a dangling one doesn't exist.
// Every failure counts as false. Prints nothing and throws nothing.
bool exists(const std::string& path) noexcept;

// Returns the text of the link at `path`, cut to its first 1024 bytes; the empty string when
// nothing is there. Anything but a link is an error.
// Prints "read_symlink: PATH" and throws.
std::string read_symlink(const std::string& path);

// Makes the link `link_path` with the text `target`, which need not exist. Anything already at
// `link_path`, even a dangling link, stays and is an error.
// Prints "create_symlink: from LINK_PATH to TARGET" and throws.
void create_symlink(const std::string& target, const std::string& link_path);

}  // namespace primitive
