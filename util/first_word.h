#pragma once

#include <string>

// Returns the first word of the regular file at `path`, through links: white space is skipped, then
// everything up to the next white space is taken, however long. If a larger file takes the place of
// the one that was looked at, no more is taken than that one would hold. Returns the empty string
// when there is no word: the file is missing or blank, or a read fails.
// Only a regular file of 1 byte to 16 MiB is opened. A pipe or a device may never come to an end.
// Some files of the kernel, which tell the size 0, may not end either. A sparse file of many GiB
// takes no room on the disk, but would fill the memory.
// With libc++ a read that fails within the word ends it there: its streams take that for the end of
// the file.
// Prints nothing. Throws std::bad_alloc, but only before it reads: the stream swallows a later one,
// and the word counts as unreadable.
std::string read_first_word(const std::string& path);
