#include "driver/legacy_icu.h"

#include <err.h>

#include <cstdio>

#include "driver/paths.h"
#include "util/primitives.h"

void migrate_legacy_icu_link() {
  if (primitive::exists(paths::legacy_icu_link) && !primitive::exists(paths::icu_link)) {
    try {
      primitive::create_symlink(primitive::read_symlink(paths::legacy_icu_link), paths::icu_link);
    } catch (...) {
      warn("Could not migrate /var/db/icutz to /var/db/timezone/icutz");
    }
  }
  if (primitive::exists(paths::legacy_icu_link)) {
    try {
      primitive::remove(paths::legacy_icu_link);
    } catch (...) {
      warn("Could not remove /var/db/icutz");
    }
  }
}

void remove_legacy_icu_entry() { (void)std::remove(paths::legacy_icu_entry); }
