#include "driver/legacy_icu.h"

#include <err.h>

#include <cstdio>

#include "util/paths.h"
#include "util/primitives.h"

void migrate_legacy_icu_link() {
  constexpr const char* old_link = paths::legacy_icu_link;
  constexpr const char* new_link = paths::icu_link;
  if (primitive::exists(old_link) && !primitive::exists(new_link)) {
    try {
      primitive::create_symlink(primitive::read_symlink(old_link), new_link);
    } catch (...) {
      // Spelled out, so that a search for the line finds it.
      warn("Could not migrate /var/db/icutz to /var/db/timezone/icutz");
    }
  }
  if (primitive::exists(old_link)) {
    try {
      primitive::remove(old_link);
    } catch (...) {
      warn("Could not remove /var/db/icutz");
    }
  }
}

void remove_legacy_icu_entry() noexcept { (void)std::remove(paths::legacy_icu_entry); }
