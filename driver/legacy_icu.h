#pragma once

// Moves the ICU link of older systems to its present place, unless a link that resolves is there
// already. Removes the old link either way. An old link that dangles is left alone.
// Prints, after the line of the primitive that failed,
//   "Could not migrate /var/db/icutz to /var/db/timezone/icutz"
//   "Could not remove /var/db/icutz"
// and goes on. Throws only std::bad_alloc.
void migrate_legacy_icu_link();

// Removes the ICU entry of older systems if it is a file, a link or an empty directory. Anything
// else stays.
// Prints nothing and throws nothing.
void remove_legacy_icu_entry() noexcept;
