#include "driver/storage.h"

#include <fcntl.h>

#include <string>

#include "driver/paths.h"
#include "platform/protection_class.h"
#include "util/descriptor.h"

namespace {

void set_protection_class(const std::string& path) {
  const olm_descriptor directory(open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (directory.is_open()) set_class_d(directory.get());
}

}  // namespace

void prepare_storage() {
  set_protection_class(paths::storage);
  set_protection_class(paths::downloads);
}
