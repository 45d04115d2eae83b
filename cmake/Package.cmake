# The Debian packages, made by script/package: one for each component. What they depend on is found
# out from the binaries; the libraries of our own, which nobody else's package provides, are told by
# their directory.

# A package depends on the libraries of the release that it was made on, so its version names that:
# 1.2.3~deb13. It gives way to a 1.2.3 of the distribution's own.
cmake_host_system_information(RESULT distribution QUERY DISTRIB_ID)
cmake_host_system_information(RESULT release QUERY DISTRIB_VERSION_ID)
set(package_version ${PROJECT_VERSION})
if(distribution AND release)
  string(REPLACE debian deb distribution "${distribution}")
  string(APPEND package_version "~${distribution}${release}")
endif()
set(CPACK_DEBIAN_PACKAGE_VERSION ${package_version})

set(maintainer "Flash Corvane maintainers <maintainers@flash-corvane.invalid>")
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_CONTACT "${maintainer}")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "") # each package has its own, as its first line
set(CPACK_PROJECT_CONFIG_FILE ${PROJECT_SOURCE_DIR}/cmake/PackageRun.cmake)
set(CPACK_PACKAGING_INSTALL_PREFIX ${CMAKE_INSTALL_PREFIX})
set(CPACK_STRIP_FILES ON)
set(CPACK_COMPONENTS_ALL tool development)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_LIBRARY_OUTPUT_DIRECTORY})
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS OFF)
if(CMAKE_SYSROOT)
  # Another architecture: its libraries, and the data base of the packages that they come from.
  list(APPEND CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS
    ${CMAKE_SYSROOT}/usr/lib/${CMAKE_LIBRARY_ARCHITECTURE})
  set(CPACK_DPKG_DATABASE ${CMAKE_SYSROOT}/dpkg)
endif()

set(CPACK_DEBIAN_TOOL_PACKAGE_NAME corvane-flash)
set(CPACK_DEBIAN_TOOL_PACKAGE_SECTION devel)
set(CPACK_DEBIAN_TOOL_DESCRIPTION
"Flash programming for the Corvane microcontrollers
Erases, programs and verifies flash on the command line.
Contains the flash plug-in for debuggers and the tool that uses it, which
programs a simulated device, or a board behind a GDB server.")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libflash-corvane-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "corvane-flash (= ${package_version})")
set(CPACK_DEBIAN_DEVELOPMENT_DESCRIPTION
"Flash programming for the Corvane microcontrollers, for debuggers
What makers of debuggers need to load the flash plug-in of corvane-flash.
Contains the headers with their CMake package and pkg-config file, a
plug-in that checks a debugger, a guide, two examples of a debugger and
one of a flash loader.")

# What Debian wants to know of every package.
set(changelog ${generated}/changelog.gz)
add_custom_command(
  OUTPUT ${changelog} VERBATIM
  DEPENDS ${PROJECT_SOURCE_DIR}/CHANGELOG.md ${PROJECT_SOURCE_DIR}/cmake/debian-changelog.sh
  COMMAND sh -ec "sh \"$1\" \"$2\" \"$3\" \"$4\" | gzip -9n > \"$0\"" ${changelog}
          ${PROJECT_SOURCE_DIR}/cmake/debian-changelog.sh ${PROJECT_SOURCE_DIR}/CHANGELOG.md
          ${maintainer} ${package_version})
install(FILES ${changelog} cmake/copyright DESTINATION ${doc_directory} COMPONENT tool)
set(overrides_directory ${CMAKE_INSTALL_DATADIR}/lintian/overrides)
install(FILES cmake/lintian/corvane-flash DESTINATION ${overrides_directory} COMPONENT tool)
install(FILES cmake/lintian/libflash-corvane-dev
        DESTINATION ${overrides_directory} COMPONENT development)

# The documents of both packages lie in one directory, which goes by both names.
file(CREATE_LINK corvane-flash ${generated}/libflash-corvane-dev SYMBOLIC)
install(FILES ${generated}/libflash-corvane-dev
        DESTINATION ${CMAKE_INSTALL_DATADIR}/doc COMPONENT development)

include(CPack)
