#include "driver/record.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "util/paths.h"

namespace {

bool has_one_name(int descriptor) {
  struct stat entry;
  return fstat(descriptor, &entry) == 0 && entry.st_nlink == 1;
}

}  // namespace

// Not by a stream: that would follow a link.
void write_record(const std::string& from, const std::string& to) {
  const std::string text = from + "_" + to;
  constexpr mode_t permissions = 0666;  // less the umask
  // O_NONBLOCK: a named pipe isn't waited for. If it has a reader, ftruncate(2) refuses it.
  constexpr int flags = O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC;
  const int descriptor = open(paths::record, flags, permissions);
  if (descriptor == -1) return;
  if (has_one_name(descriptor) && ftruncate(descriptor, 0) == 0) {
    [[maybe_unused]] const ssize_t written = write(descriptor, text.data(), text.size());
  }
  close(descriptor);
}
