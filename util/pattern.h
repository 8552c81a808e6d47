#pragma once

#include <regex>

// Returns the compiled ECMAScript `pattern`. Compiling costs more than everything else that a
// typical run computes: do it when the pattern is first needed, and once.
// Prints nothing; raises std::regex_error for a malformed pattern.
std::regex compile_pattern(const char* pattern);
