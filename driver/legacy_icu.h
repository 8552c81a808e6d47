#pragma once

// Moves the ICU link of older systems to its present place, unless a link that resolves is there
// already, and removes the old one. An old link that leads nowhere is left alone.
// Prints, after the failed primitive's line,
//   "Could not migrate /var/db/icutz to /var/db/timezone/icutz"
//   "Could not remove /var/db/icutz"
// and goes on: it raises nothing but lack of memory.
void migrate_legacy_icu_link();

// Removes the ICU entry of older systems: a file, a link or an empty directory. Anything else
// stays. Prints nothing and raises nothing.
void remove_legacy_icu_entry();
