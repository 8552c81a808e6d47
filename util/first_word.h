#pragma once

#include <string>

// Returns the first word of the regular file `path`: white space is skipped, then everything up to
// the next white space is taken, however long. Empty when there is none: the file is missing, isn't
// a regular file, can't be opened or read to the end of the word, or holds only white space.
// Prints nothing; raises nothing but lack of memory.
std::string first_word(const std::string& path);
