# What `cmake --install` puts where. There are two components: the tool with the libraries that it
# loads, and what makers of debuggers need besides. The man page and the completions come out of the
# tool itself, so that they can't drift from its help.

# The libraries are loaded, not linked, and the maker's logger has the file name of the stand-in:
# they stay out of the directory that everybody's libraries lie in.
set(plugin_directory ${CMAKE_INSTALL_LIBDIR}/flash_corvane)
set(doc_directory ${CMAKE_INSTALL_DATADIR}/doc/corvane-flash)
include(cmake/Kit.cmake)
install(TARGETS flash_corvane ostrel_logger EXPORT FlashCorvane
        LIBRARY DESTINATION ${plugin_directory} COMPONENT tool)
install(TARGETS flash_host_check EXPORT FlashCorvane
        LIBRARY DESTINATION ${plugin_directory} COMPONENT development)
install(TARGETS corvane-flash RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tool)

# For whoever builds with pkg-config. The prefix is found from where the file lies.
set(pkgconfig_directory ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
file(RELATIVE_PATH prefix_from_pkgconfig /prefix/${pkgconfig_directory} /prefix)
configure_file(cmake/flash-corvane.pc.in flash-corvane.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/flash-corvane.pc
        DESTINATION ${pkgconfig_directory} COMPONENT development)

# corvane_generate(FILE ARGUMENT...): writes what the tool prints to generated/FILE.
set(generated ${PROJECT_BINARY_DIR}/generated)
file(MAKE_DIRECTORY ${generated})
function(corvane_generate file)
  add_custom_command(
    OUTPUT ${generated}/${file} DEPENDS corvane-flash VERBATIM
    COMMAND sh -ec "\"$@\" > \"$0.new\"; mv \"$0.new\" \"$0\""
            ${generated}/${file} $<TARGET_FILE:corvane-flash> ${ARGN})
endfunction()

foreach(shell bash zsh fish)
  corvane_generate(corvane-flash.${shell} completion ${shell})
endforeach()
corvane_generate(corvane-flash.1 --man)
add_custom_command(
  OUTPUT ${generated}/corvane-flash.1.gz DEPENDS ${generated}/corvane-flash.1
  COMMAND gzip -9nfk ${generated}/corvane-flash.1)

set(data ${CMAKE_INSTALL_DATADIR})
install(FILES ${generated}/corvane-flash.bash RENAME corvane-flash
        DESTINATION ${data}/bash-completion/completions COMPONENT tool)
install(FILES ${generated}/corvane-flash.zsh RENAME _corvane-flash
        DESTINATION ${data}/zsh/vendor-completions COMPONENT tool)
install(FILES ${generated}/corvane-flash.fish
        DESTINATION ${data}/fish/vendor_completions.d COMPONENT tool)
install(FILES ${generated}/corvane-flash.1.gz
        DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT tool)

include(cmake/Package.cmake)

# All that `cmake --install` needs, without the tests.
add_custom_target(kit ALL DEPENDS flash_corvane flash_host_check ostrel_logger corvane-flash
  ${generated}/corvane-flash.bash ${generated}/corvane-flash.zsh ${generated}/corvane-flash.fish
  ${generated}/corvane-flash.1.gz ${generated}/changelog.gz)
