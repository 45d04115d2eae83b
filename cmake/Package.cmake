# The Debian package, made by script/package. What it depends on is found out from the binaries; the
# two libraries of our own, which nobody else's package provides, are told by their directory.

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME corvane-flash)
set(CPACK_PACKAGE_CONTACT "Flash Corvane maintainers <maintainers@localhost>")
set(CPACK_PACKAGING_INSTALL_PREFIX ${CMAKE_INSTALL_PREFIX})
set(CPACK_STRIP_FILES ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION devel)
set(CPACK_DEBIAN_PACKAGE_DESCRIPTION
"Erases, programs and verifies flash on the command line.
Contains the flash plug-in for debuggers, the tool that uses it, and the headers
and CMake package for makers of debuggers.")
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_LIBRARY_OUTPUT_DIRECTORY})
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS OFF)

include(CPack)
