#include "driver/storage.h"

#include <fcntl.h>
#include <unistd.h>

#include "dataset/dataset.h"
#include "driver/paths.h"
#include "platform/protection_class.h"

namespace {

// Owns what open(2) returned and closes it at the end of its scope; -1, a failed open, owns
// nothing.
class olm_descriptor {
 public:
  explicit olm_descriptor(int opened) noexcept : number(opened) {}
  ~olm_descriptor() {
    if (is_open()) close(number);
  }
  olm_descriptor(const olm_descriptor&) = delete;
  olm_descriptor& operator=(const olm_descriptor&) = delete;

  bool is_open() const noexcept { return number != -1; }
  int get() const noexcept { return number; }

 private:
  const int number;
};

void set_protection_class(const char* path) noexcept {
  const olm_descriptor directory(open(path, O_RDONLY | O_CLOEXEC));
  if (directory.is_open()) set_class_d(directory.get());
}

}  // namespace

void prepare_storage() noexcept {
  set_protection_class(paths::storage);
  set_protection_class(olm_dataset::downloads_root);
}
