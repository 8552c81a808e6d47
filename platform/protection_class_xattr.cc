#include <sys/xattr.h>

#include <string_view>

#include "platform/protection_class.h"

void set_class_d(int descriptor) noexcept {
  constexpr char attribute[] = "user.protection_class";
  constexpr std::string_view class_d = "4";
  fsetxattr(descriptor, attribute, class_d.data(), class_d.size(), 0);
}
