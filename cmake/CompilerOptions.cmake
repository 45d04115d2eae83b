# corvane_options(TARGET): what every target of the project is compiled with. Only the presets
# of CI make warnings errors: whoever builds it with another compiler is warned and goes on.
#
# GCC 12 finds copies in std::string that overlap, and searches of std::string_view that are too long, which
# cannot happen: hence -Wno-restrict and -Wno-stringop-overread.

function(corvane_options target)
  target_include_directories(${target} PRIVATE ${PROJECT_SOURCE_DIR})
  target_compile_options(${target} PRIVATE
    -Wall -Wextra -Wpedantic -Wconversion -Wsign-conversion -Wshadow -Wold-style-cast
    -Wcast-qual -Wformat=2 -Wundef -Woverloaded-virtual -Wdouble-promotion
    $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond -Wlogical-op -Wno-restrict
      -Wno-stringop-overread>)
  if(NOT WIN32 AND NOT CORVANE_SANITIZE)
    # What Debian builds its packages with.
    target_compile_options(${target} PRIVATE
      $<$<CONFIG:Release>:-fstack-protector-strong -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2>)
    target_link_options(${target} PRIVATE $<$<CONFIG:Release>:LINKER:-z,relro,-z,now>)
  endif()
  if(CORVANE_SANITIZE)
    target_compile_options(${target} PRIVATE
      -fsanitize=${CORVANE_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
    target_link_options(${target} PRIVATE -fsanitize=${CORVANE_SANITIZE})
  endif()
endfunction()
