# The headers that a host includes, in the kit of every system.

include(GNUInstallDirs)

install(FILES plugin/IFlashHost.h plugin/IFlashDevice2.h plugin/flash_corvane.h
              logger/ostrel_logger.h
        DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/flash_corvane)

# The headers tell the kit's version; they are no templates, so that they compile where they lie.
foreach(header plugin/IFlashDevice2.h plugin/flash_corvane.h)
  file(STRINGS ${header} version REGEX "^#define FLASH_CORVANE_VERSION")
  list(TRANSFORM version REPLACE "^.* " "")
  if(NOT version STREQUAL "${PROJECT_VERSION_MAJOR};${PROJECT_VERSION_MINOR};${PROJECT_VERSION_PATCH};\"${PROJECT_VERSION}\"")
    message(FATAL_ERROR "${header} tells another version than ${PROJECT_VERSION}: ${version}")
  endif()
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${header})
endforeach()
