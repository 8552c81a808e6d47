#include "driver/selection.h"

#include <err.h>

#include <string>

#include "dataset/dataset.h"
#include "driver/link_state.h"
#include "driver/record.h"

namespace {

void reset_to_system() { olm_dataset().install_links(); }

// Returns the directory of the data set that the links name; after a reset, the system data set's.
std::string current_path_or_reset() {
  try {
    return read_current_path();
  } catch (...) {
    warn("Invalid current symlinks; resetting to system partition");
    reset_to_system();
    return {};
  }
}

void select_and_install_or_throw() {
  const olm_dataset system;
  const std::string latest_path = read_latest_path();
  const olm_dataset current(current_path_or_reset());

  const bool current_stays = current.compatible_with(system) && !system.newer_than(current);
  if (!current_stays) {
    warn("Symlink points at data incompatible with installed system");
    reset_to_system();
  }
  const olm_dataset& active = current_stays ? current : system;

  if (latest_path.empty()) return;
  const olm_dataset update(latest_path);
  // Compared with what was current at the start, even if that has just been given up.
  if (update.compatible_with(system) && update.newer_than(current)) {
    update.install_links();
    write_record(active.version_string(), update.version_string());
  } else {
    warn("New update not compatible or older version: %s vs. %s", update.version_string().c_str(),
         current.version_string().c_str());
  }
}

}  // namespace

void select_and_install() {
  try {
    select_and_install_or_throw();
  } catch (...) {
    warn("Unable to locate data; resetting to system partition");
    reset_to_system();
  }
}
