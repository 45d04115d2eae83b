# The Debian package, made by script/package. What it depends on is found out from the binaries; the
# two libraries of our own, which nobody else's package provides, are told by their directory.

set(maintainer "Flash Corvane maintainers <maintainers@flash-corvane.invalid>")
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME corvane-flash)
set(CPACK_PACKAGE_CONTACT "${maintainer}")
set(CPACK_PROJECT_CONFIG_FILE ${PROJECT_SOURCE_DIR}/cmake/PackageRun.cmake)
set(CPACK_PACKAGING_INSTALL_PREFIX ${CMAKE_INSTALL_PREFIX})
set(CPACK_STRIP_FILES ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION devel)
set(CPACK_DEBIAN_PACKAGE_DESCRIPTION
"Erases, programs and verifies flash on the command line.
Contains the flash plug-in for debuggers, the tool that uses it, and the
headers and CMake package for makers of debuggers.")
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_LIBRARY_OUTPUT_DIRECTORY})
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS OFF)

# What Debian wants to know of every package.
set(changelog ${PROJECT_BINARY_DIR}/generated/changelog.gz)
add_custom_command(
  OUTPUT ${changelog} VERBATIM
  DEPENDS ${PROJECT_SOURCE_DIR}/CHANGELOG.md ${PROJECT_SOURCE_DIR}/cmake/debian-changelog.sh
  COMMAND sh -ec "sh \"$1\" \"$2\" \"$3\" | gzip -9n > \"$0\"" ${changelog}
          ${PROJECT_SOURCE_DIR}/cmake/debian-changelog.sh ${PROJECT_SOURCE_DIR}/CHANGELOG.md
          ${maintainer})
install(FILES ${changelog} ${PROJECT_SOURCE_DIR}/cmake/copyright
        DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/corvane-flash)

include(CPack)
