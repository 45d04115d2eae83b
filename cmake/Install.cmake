# What `cmake --install` puts where. There are two components: the tool with the libraries that it
# loads, and what makers of debuggers need besides.

# The libraries are loaded, not linked, and the maker's logger has the file name of the stand-in:
# they stay out of the directory that everybody's libraries lie in.
set(plugin_directory ${CMAKE_INSTALL_LIBDIR}/flash_corvane)
set(doc_directory ${CMAKE_INSTALL_DATADIR}/doc/corvane-flash)
include(cmake/Kit.cmake)
install(TARGETS flash_corvane ostrel_logger EXPORT FlashCorvane
        LIBRARY DESTINATION ${plugin_directory} COMPONENT tool)
install(TARGETS flash_host_check EXPORT FlashCorvane
        LIBRARY DESTINATION ${plugin_directory} COMPONENT development)
# For whoever builds with pkg-config. The prefix is found from where the file lies.
set(pkgconfig_directory ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
file(RELATIVE_PATH prefix_from_pkgconfig /prefix/${pkgconfig_directory} /prefix)
configure_file(cmake/flash-corvane.pc.in flash-corvane.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/flash-corvane.pc
        DESTINATION ${pkgconfig_directory} COMPONENT development)

set(generated ${PROJECT_BINARY_DIR}/generated)
file(MAKE_DIRECTORY ${generated})
if(CORVANE_TOOL)
  include(cmake/InstallTool.cmake)
endif()
