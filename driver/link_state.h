#pragma once

#include <string>

// What the links say at the start of a run. Nothing is changed. A data set is named by its
// directory, the system data set by the empty string.

// Returns the text of the link to the newest download, whatever it is; empty when there is no link.
// Prints and raises what primitive::read_symlink does.
std::string read_latest_path();

// Returns the data set whose tz database tree a link with the text `link` names. Only the shape of
// the text counts: the built-in tree itself, or something in a directory below that of the
// downloads. Prints "Bad zoneinfo link LINK" and raises no_error_number for any other text.
std::string parse_zoneinfo_link(const std::string& link);

// Returns the data set that the zoneinfo link names now. A missing link is a bad one.
// Prints and raises what primitive::read_symlink and parse_zoneinfo_link do.
std::string read_current_path();
