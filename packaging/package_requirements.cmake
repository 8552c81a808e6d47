# Read by cpack first: refuses what would give a package that says something wrong of itself.
if(CPACK_OLMBOOT_CROSS AND NOT CPACK_DEBIAN_PACKAGE_ARCHITECTURE)
  message(FATAL_ERROR "The toolchain file must set CPACK_DEBIAN_PACKAGE_ARCHITECTURE.")
endif()
find_program(OLMBOOT_SHLIBDEPS dpkg-shlibdeps)
if(CPACK_DEBIAN_PACKAGE_SHLIBDEPS AND NOT OLMBOOT_SHLIBDEPS)
  message(FATAL_ERROR "Without dpkg-shlibdeps (package dpkg-dev) the package would have no dependencies.")
endif()
