#pragma once

// Decides which data set is active and points the links at it. The current data set, which the
// links name at the start, stays if it is compatible with the system data set and not older.
// Otherwise the links are reset to the system data set. Then the newest download is installed and
// recorded if it is compatible with the system data set and newer than the current one. After
// a zoneinfo link that names no data set or can't be read, the links are reset, and the decision
// goes on with the system data set as the current one; any other error ends it with a reset. A file
// that can't be read is no error: it counts as missing.
// Prints, besides the lines of what it calls,
//   "Invalid current symlinks; resetting to system partition"
//   "Symlink points at data incompatible with installed system"
//   "New update not compatible or older version: UPDATE vs. CURRENT"
//   "Unable to locate data; resetting to system partition"
// Throws only if that last reset fails: what olm_dataset and its install_links throw.
void select_and_install();
