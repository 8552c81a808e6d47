#include "util/openable.h"

#include <sys/stat.h>

#include <cerrno>

bool openable(const std::string& path) noexcept {
  struct stat status;
  return stat(path.c_str(), &status) == 0 ? S_ISREG(status.st_mode) : errno == ENOENT;
}
