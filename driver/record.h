#pragma once

#include <string>

// Replaces the record of the last update by `from`, "_" and `to`, two version strings, without a
// line end. The record is made where it is missing. It is written only into a regular file that has
// no other name, and never through a link: anything else may be anybody's, and stays as it is.
// Prints nothing, as the update is installed all the same when the record can't be written. Throws
// only std::bad_alloc.
void write_record(const std::string& from, const std::string& to);
