# Read by cpack when it runs. The times in a package are those of its sources, so that two runs give
# the same bytes: what SOURCE_DATE_EPOCH says, or the last change, or the changelog's.

set(sources ${CMAKE_CURRENT_LIST_DIR}/..)
if("$ENV{SOURCE_DATE_EPOCH}" STREQUAL "")
  execute_process(COMMAND git -C ${sources} log -1 --format=%ct OUTPUT_VARIABLE changed
                  OUTPUT_STRIP_TRAILING_WHITESPACE ERROR_QUIET RESULT_VARIABLE failed)
  if(failed OR changed STREQUAL "")
    file(TIMESTAMP ${sources}/CHANGELOG.md changed %s UTC)
  endif()
  set(ENV{SOURCE_DATE_EPOCH} ${changed})
endif()

# dpkg-shlibdeps finds what the binaries depend on.
if(CPACK_DPKG_DATABASE)
  set(ENV{DPKG_ADMINDIR} ${CPACK_DPKG_DATABASE})
  set(ENV{DEB_HOST_ARCH} ${CPACK_DEBIAN_PACKAGE_ARCHITECTURE})
endif()
