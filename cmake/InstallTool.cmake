# The tool, its man page and its completions. With them go the packages.

install(TARGETS corvane-flash RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tool)

# Nothing that is installed comes out of the built tool: it may be built for another machine.
set(data ${CMAKE_INSTALL_DATADIR})
set(completions ${PROJECT_SOURCE_DIR}/host/cli/completions)
install(FILES ${completions}/corvane-flash.bash RENAME corvane-flash
        DESTINATION ${data}/bash-completion/completions COMPONENT tool)
install(FILES ${completions}/corvane-flash.zsh RENAME _corvane-flash
        DESTINATION ${data}/zsh/vendor-completions COMPONENT tool)
install(FILES ${completions}/corvane-flash.fish
        DESTINATION ${data}/fish/vendor_completions.d COMPONENT tool)

set(manual ${PROJECT_SOURCE_DIR}/host/cli/corvane-flash.1)
add_custom_command(
  OUTPUT ${generated}/corvane-flash.1.gz DEPENDS ${manual} VERBATIM
  COMMAND sh -c "gzip -9nc \"$1\" > \"$0\"" ${generated}/corvane-flash.1.gz ${manual})
install(FILES ${generated}/corvane-flash.1.gz
        DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT tool)

include(cmake/Package.cmake)

# All that `cmake --install` needs, without the tests.
add_custom_target(kit ALL DEPENDS flash_corvane flash_host_check ostrel_logger corvane-flash
  ${generated}/corvane-flash.1.gz ${generated}/changelog.gz)
