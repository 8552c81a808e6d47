#pragma once

#include <string>

// Replaces the record of the last update by `from`, "_" and `to`, without a line end. A record that
// can't be opened or written is left as it then is.
// Prints nothing. Throws only std::bad_alloc.
void write_record(const std::string& from, const std::string& to);
