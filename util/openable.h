#pragma once

#include <string>

// Returns whether a plain open of `path` comes back and what it opens has an end: a regular file
// stands there, links followed, or nothing does. A named pipe would block the boot for ever and a
// device might never end.
// Prints nothing and raises nothing.
bool openable(const std::string& path) noexcept;
