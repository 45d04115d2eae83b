# What makers of hosts find in the kit of every system: headers, CMake package, documents, examples.
# Whoever includes this installs the libraries with EXPORT FlashCorvane, and sets doc_directory.

include(CMakePackageConfigHelpers)
include(GNUInstallDirs)

set(headers plugin/IFlashHost.h plugin/IFlashDevice2.h plugin/flash_corvane.h logger/ostrel_logger.h)
install(FILES ${headers}
        DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/flash_corvane COMPONENT development)

# The headers tell the kit's version; they are no templates, so that they compile where they lie.
foreach(header plugin/IFlashDevice2.h plugin/flash_corvane.h)
  file(STRINGS ${header} version REGEX "^#define FLASH_CORVANE_VERSION")
  list(TRANSFORM version REPLACE "^.* " "")
  if(NOT version STREQUAL "${PROJECT_VERSION_MAJOR};${PROJECT_VERSION_MINOR};${PROJECT_VERSION_PATCH};\"${PROJECT_VERSION}\"")
    message(FATAL_ERROR "${header} tells another version than ${PROJECT_VERSION}: ${version}")
  endif()
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${header})
endforeach()

# The headers as a target of their own: a host sees the plug-in through them alone, and loads it. A
# project that has this tree in it includes them under the names that they have when installed.
foreach(header ${headers})
  get_filename_component(name ${header} NAME)
  configure_file(${header} ${PROJECT_BINARY_DIR}/include/flash_corvane/${name} COPYONLY)
endforeach()
add_library(corvane_headers INTERFACE)
set_target_properties(corvane_headers PROPERTIES EXPORT_NAME headers)
target_include_directories(corvane_headers INTERFACE
  $<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/include>
  $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>)
install(TARGETS corvane_headers EXPORT FlashCorvane)
add_library(FlashCorvane::headers ALIAS corvane_headers)
foreach(library flash_corvane flash_host_check ostrel_logger)
  add_library(FlashCorvane::${library} ALIAS ${library})
endforeach()

set(package_directory ${CMAKE_INSTALL_LIBDIR}/cmake/FlashCorvane)
install(EXPORT FlashCorvane NAMESPACE FlashCorvane:: FILE FlashCorvaneTargets.cmake
        DESTINATION ${package_directory} COMPONENT development)
configure_package_config_file(cmake/FlashCorvaneConfig.cmake.in
        ${PROJECT_BINARY_DIR}/FlashCorvaneConfig.cmake INSTALL_DESTINATION ${package_directory})
write_basic_package_version_file(
        ${PROJECT_BINARY_DIR}/FlashCorvaneConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/FlashCorvaneConfig.cmake
              ${PROJECT_BINARY_DIR}/FlashCorvaneConfigVersion.cmake
        DESTINATION ${package_directory} COMPONENT development)

# The documents lie as in the source tree, so that the links between them lead somewhere. Those that
# tell of the source tree stay there; the kit has a README of its own.
install(FILES cmake/KitReadme.md RENAME README.md DESTINATION ${doc_directory} COMPONENT tool)
install(FILES CHANGELOG.md DESTINATION ${doc_directory} COMPONENT tool)
install(FILES docs/boards.md docs/command-line-json.md docs/debuggers.md docs/simulated-device.md
        docs/windows.md
        DESTINATION ${doc_directory}/docs COMPONENT tool)
install(FILES docs/host-guide.md docs/host-transcript.md
        DESTINATION ${doc_directory}/docs COMPONENT development)
install(DIRECTORY examples DESTINATION ${doc_directory} COMPONENT development)
