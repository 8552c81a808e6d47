#pragma once

// Decides which copy of the data is active and points the links at it. The copy that they name now
// stays while it fits the system's and is not older; otherwise the system's takes its place. The
// newest download is installed, and recorded, when it fits the system's copy and is newer than the
// one that the links named at the start. An error anywhere in this ends in the system's copy.
// Prints, besides the lines of what it calls,
//   "Invalid current symlinks; resetting to system partition"
//   "Symlink points at data incompatible with installed system"
//   "New update not compatible or older version: UPDATE vs. CURRENT"
//   "Unable to locate data; resetting to system partition"
// Raises only what the reset after the last of these raises.
void select_and_install();
