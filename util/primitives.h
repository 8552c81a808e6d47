#pragma once

#include <string>

// The filesystem operations of the program, each one system call on an absolute path. Where one
// fails, it prints a single line that ends in the call's error, and raises that error number as
// filesystem_error. Nothing is retried and nothing is undone.
//
// Always called with the namespace written out, as the C library's remove always is with std::.
namespace primitive {

// Removes the file or link at `path`; a link itself, never what it names. Nothing there: silent.
// A directory is a failure.
// Prints "remove: could not remove PATH" and raises.
void remove(const std::string& path);

// Returns whether `path` leads to something. Links are followed: a dangling one doesn't exist.
// Prints nothing and raises nothing; every failure is false.
bool exists(const std::string& path) noexcept;

// Returns the text of the link at `path`, its first 1024 bytes where it is longer; the empty string
// when nothing is there. Anything but a link is a failure.
// Prints "read_symlink: PATH" and raises.
std::string read_symlink(const std::string& path);

// Makes the link `link_path` with the text `target`, which need not exist. Anything that is already
// at `link_path`, a dangling link too, stays as it is and is a failure.
// Prints "create_symlink: from LINK_PATH to TARGET" and raises.
void create_symlink(const std::string& target, const std::string& link_path);

}  // namespace primitive
