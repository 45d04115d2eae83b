# The archive for Windows, made by script/package windows: the tool in the one for 64 bit, the libraries,
# and for makers of debuggers the headers with their CMake package, and the documents.

set(doc_directory .)
include(cmake/Kit.cmake)
install(TARGETS flash_corvane flash_host_check ostrel_logger EXPORT FlashCorvane
        RUNTIME DESTINATION bin)
if(CORVANE_TOOL)
  install(TARGETS corvane-flash RUNTIME DESTINATION bin)
  install(FILES host/cli/completions/corvane-flash.ps1 DESTINATION completions)
endif()

set(CPACK_GENERATOR ZIP)
set(CPACK_PACKAGE_FILE_NAME flash-corvane-${PROJECT_VERSION}-windows-${windows_name})
set(CPACK_STRIP_FILES ON)
include(CPack)
