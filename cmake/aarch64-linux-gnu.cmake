# Builds for 64 bit ARM with Debian's g++-aarch64-linux-gnu. To build for another target, copy this
# file and change the names.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)
set(CMAKE_C_COMPILER aarch64-linux-gnu-gcc)
set(CMAKE_CXX_COMPILER aarch64-linux-gnu-g++)
find_program(OLMBOOT_EMULATOR NAMES qemu-aarch64-static qemu-aarch64)
# Runs the tests, with the target's libraries that the compiler brings. Not by the emulator's -L: it
# maps paths to that directory, even in the tests' own root.
set(CMAKE_CROSSCOMPILING_EMULATOR ${OLMBOOT_EMULATOR} /usr/aarch64-linux-gnu/lib/ld-linux-aarch64.so.1
  --library-path /usr/aarch64-linux-gnu/lib)
# What the Debian package says of the target.
set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE arm64)
