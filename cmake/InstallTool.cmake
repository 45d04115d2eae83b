# The tool, and what it prints of itself: man page and completions. With it go the packages.

install(TARGETS corvane-flash RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tool)

# corvane_generate(FILE ARGUMENT...): writes what the tool prints to generated/FILE.
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
