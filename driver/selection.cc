#include "driver/selection.h"

#include <err.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include "dataset/dataset.h"
#include "driver/link_state.h"
#include "util/paths.h"

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

// Whether the open `file` has no other name. With one it may be anybody's.
bool has_one_name(int file) {
  struct stat status;
  return fstat(file, &status) == 0 && status.st_nlink == 1;
}

// Replaces the record of the last update by `from`, "_" and `to`, without a line end. Not by a
// stream: that would follow a link. A failure isn't reported: the update is installed all the same.
void write_record(const std::string& from, const std::string& to) {
  const std::string text = from + "_" + to;
  constexpr mode_t permissions = 0666;  // less the umask
  // O_NONBLOCK: a named pipe isn't waited for. If it has a reader, ftruncate(2) refuses it.
  constexpr int how = O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC;
  const int file = open(paths::record, how, permissions);
  if (file == -1) return;
  if (has_one_name(file) && ftruncate(file, 0) == 0) {
    [[maybe_unused]] const ssize_t written = write(file, text.data(), text.size());
  }
  close(file);
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
