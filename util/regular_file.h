#pragma once

#include <string>

// Returns whether `path` is a regular file (following links) or doesn't exist. Opening anything
// else could hang the boot: a named pipe waits for its other end, and a device may have no end.
// Prints nothing and throws nothing.
bool is_regular_or_absent(const std::string& path) noexcept;

// Returns the first word of the regular file `path`: white space is skipped, then everything up to
// the next white space is taken, however long. Returns the empty string when there is no word: the
// file is missing, not a regular file, can't be read to the end of the word, or is blank.
// Prints nothing. Throws std::bad_alloc, but only before it reads: the stream swallows a later one,
// and the word counts as unreadable.
std::string read_first_word(const std::string& path);
