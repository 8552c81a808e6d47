#pragma once

#include <string>

// Writes the record of an installed update, `from`, "_" and `to` and nothing else, over the one
// before. A record that can't be opened or written is left as it then is.
// Prints nothing; raises nothing but lack of memory.
void write_record(const std::string& from, const std::string& to);
