#include "driver/storage.h"

#include <fcntl.h>
#include <unistd.h>

#include "platform/protection_class.h"
#include "util/paths.h"

namespace {

void set_protection_class(const char* path) noexcept {
  const int directory = open(path, O_RDONLY | O_CLOEXEC);
  if (directory == -1) return;
  set_class_d(directory);
  close(directory);
}

}  // namespace

void prepare_storage() noexcept {
  set_protection_class(paths::storage);
  set_protection_class(paths::downloads);
}
