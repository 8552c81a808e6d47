#include "driver/localtime.h"

#include <err.h>

#include <cstdio>
#include <string>
#include <string_view>

#include "util/paths.h"
#include "util/primitives.h"
#include "util/starts_with.h"

namespace {

constexpr char default_zone[] = "America/Los_Angeles";

// Removes what is there first: symlink(2) replaces nothing.
void replace_link(const std::string& target) {
  (void)std::remove(paths::localtime_link);
  primitive::create_symlink(target, paths::localtime_link);
}

// Returns whether the link is good, as it was or after correction.
bool keep_or_correct() {
  constexpr std::string_view old_prefix = paths::legacy_zoneinfo_prefix;
  try {
    std::string target = primitive::read_symlink(paths::localtime_link);
    if (starts_with(target, paths::zoneinfo_link)) return true;
    if (!starts_with(target, old_prefix)) return false;
    target.replace(0, old_prefix.size(), paths::zoneinfo_link);
    warn("Correcting localtime link to %s", target.c_str());
    if (!primitive::exists(target)) return false;
    replace_link(target);
    return true;
  } catch (...) {
    return false;  // the primitive that failed has printed the cause
  }
}

}  // namespace

void repair_localtime_link() {
  if (keep_or_correct()) return;
  warn("localtime link invalid; resetting to %s", default_zone);
  replace_link(std::string(paths::zoneinfo_link) + "/" + default_zone);
}
