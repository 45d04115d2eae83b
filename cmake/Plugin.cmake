# The plug-in: everything that a debugging host loads. It needs Boost's headers and the C++
# runtime, and resolves the logger when it is loaded.

add_library(flash_corvane SHARED
  device/DeviceInformation.cpp
  device/Identification.cpp
  device/SettingsReset.cpp
  flash/Erase.cpp
  flash/InitializeDevice.cpp
  flash/Program.cpp
  flash/ProgramLoad.cpp
  flash/WriteKey.cpp
  operations/MacAddress.cpp
  operations/PerformOperation.cpp
  operations/UserRegisters.cpp
  plugin/Conversions.cpp
  plugin/CreateFlashDevice2.cpp
  plugin/HostAccess.cpp
  verify/BlankCheck.cpp
  verify/Checksum.cpp
  verify/Ranges.cpp)
corvane_options(flash_corvane)
target_link_libraries(flash_corvane PRIVATE Boost::headers)

if(WIN32)
  target_sources(flash_corvane PRIVATE plugin/exports.def)
  target_link_libraries(flash_corvane PRIVATE ostrel_logger_imports)
  corvane_windows_library(flash_corvane "Flash programming for the Corvane microcontrollers")
  return()
endif()

target_link_libraries(flash_corvane PRIVATE ostrel_logger)
set(exports ${PROJECT_SOURCE_DIR}/plugin/exports.map)
target_link_options(flash_corvane PRIVATE LINKER:--version-script=${exports} LINKER:-z,now)
if(NOT CORVANE_SANITIZE)
  target_link_options(flash_corvane PRIVATE LINKER:--no-undefined)
endif()
set_target_properties(flash_corvane PROPERTIES
  LINK_DEPENDS ${exports}
  BUILD_RPATH_USE_ORIGIN ON
  INSTALL_RPATH "$ORIGIN")
