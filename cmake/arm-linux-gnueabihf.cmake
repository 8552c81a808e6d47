# Builds for 32 bit ARM with Debian's g++-arm-linux-gnueabihf. To build for another target, copy this
# file and change the names.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR armv7l)
set(CMAKE_C_COMPILER arm-linux-gnueabihf-gcc)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)
find_program(OLMBOOT_EMULATOR NAMES qemu-arm-static qemu-arm)
# Runs the tests, with the target's libraries that the compiler brings. Not by the emulator's -L: it
# maps paths to that directory, even in the tests' own root.
set(CMAKE_CROSSCOMPILING_EMULATOR ${OLMBOOT_EMULATOR} /usr/arm-linux-gnueabihf/lib/ld-linux-armhf.so.3
  --library-path /usr/arm-linux-gnueabihf/lib)
# What the Debian package says of the target.
set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE armhf)
