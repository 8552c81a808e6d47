#include <fcntl.h>

#include "platform/protection_class.h"

namespace {

// Not every version of the platform's headers names these.
#ifndef F_SETPROTECTIONCLASS
constexpr int F_SETPROTECTIONCLASS = 64;
#endif
#ifndef PROTECTION_CLASS_D
constexpr int PROTECTION_CLASS_D = 4;
#endif

}  // namespace

void set_class_d(int descriptor) noexcept {
  fcntl(descriptor, F_SETPROTECTIONCLASS, PROTECTION_CLASS_D);
}
