#pragma once

// Puts the open directory `descriptor` into data protection class D. A failure is not reported: the
// directory is usable in any class. Each kind of platform has its own implementation:
//   protection_class_fcntl.cc  where the kernel has data protection;
//   protection_class_xattr.cc  elsewhere: the class is kept in the directory's extended attribute
//                              user.protection_class.
// Prints nothing and throws nothing.
void set_class_d(int descriptor) noexcept;
