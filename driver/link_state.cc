#include "driver/link_state.h"

#include <err.h>

#include <string_view>

#include "util/paths.h"
#include "util/primitives.h"
#include "util/starts_with.h"

std::string read_latest_path() { return primitive::read_symlink(paths::latest_link); }

std::string parse_zoneinfo_link(const std::string& link) {
  constexpr std::string_view root = paths::downloads;
  if (starts_with(link, root)) {
    // At least one character must stand between the root's own slash and the last one.
    const std::size_t last_slash = link.rfind('/');
    if (last_slash > root.size()) return link.substr(0, last_slash);
  } else if (link == paths::system_zoneinfo) {
    return {};
  }
  warn("Bad zoneinfo link %s", link.c_str());
  throw filesystem_error(no_error_number);
}

std::string read_current_path() {
  return parse_zoneinfo_link(primitive::read_symlink(paths::zoneinfo_link));
}
