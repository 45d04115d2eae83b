# The archive for makers of debuggers on Windows, made by script/package windows: the libraries, the
# headers with their CMake package, and the documents.

include(cmake/Kit.cmake)
install(TARGETS flash_corvane flash_host_check ostrel_logger EXPORT FlashCorvane
        RUNTIME DESTINATION bin)
install(FILES ${documents} DESTINATION .)
install(DIRECTORY docs examples DESTINATION .)

set(CPACK_GENERATOR ZIP)
set(CPACK_PACKAGE_FILE_NAME flash-corvane-${PROJECT_VERSION}-windows-${windows_name})
set(CPACK_STRIP_FILES ON)
include(CPack)
