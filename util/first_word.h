#pragma once

#include <string>

// Returns the first word of the regular file `path`: white space is skipped, then everything up to
// the next white space is taken, however long. Empty when there is none: the file is missing, can't
// be opened or read, isn't a regular file, or holds only white space.
// Prints nothing; raises only when memory runs out.
std::string first_word(const std::string& path);
