#pragma once

#include <string>

// What the links say at the start of a run. Nothing is changed. A data set is named by its
// directory, the system data set by the empty string.

// Returns the text of the link to the newest download, unchecked; the empty string when there is
// no link.
// Prints and throws what primitive::read_symlink does.
std::string read_latest_path();

// Returns the data set that `link`, the text of a zoneinfo link, names. Only the text counts: the
// path of the system's tree names the system data set, and DOWNLOAD/NAME the download DOWNLOAD, if
// that is below the directory of the downloads.
// For any other text, prints "Bad zoneinfo link LINK" and throws no_error_number.
std::string parse_zoneinfo_link(const std::string& link);

// Returns the data set that the zoneinfo link names. A missing link is a bad one.
// Prints and throws what primitive::read_symlink and parse_zoneinfo_link do.
std::string read_current_path();
