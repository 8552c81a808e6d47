#pragma once

// Puts the open directory `descriptor` into data protection class D. A failure is not reported:
// the directory is usable in any class. There is one implementation for each kind of platform:
//   - protection_class_fcntl.cc, where the kernel has data protection;
//   - protection_class_xattr.cc, elsewhere: the class is kept on the directory, for whoever asks,
//     as the extended attribute user.protection_class.
// Prints nothing and raises nothing.
void set_class_d(int descriptor) noexcept;
