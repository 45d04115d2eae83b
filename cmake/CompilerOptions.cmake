# corvane_options(TARGET): what every target of the project is compiled with. The presets make
# warnings errors; whoever packages it with another compiler is only warned.
#
# GCC 12 finds overlapping copies in std::string that cannot happen, hence -Wno-restrict.

function(corvane_options target)
  target_include_directories(${target} PRIVATE ${PROJECT_SOURCE_DIR})
  target_compile_options(${target} PRIVATE
    -Wall -Wextra -Wpedantic -Wconversion -Wsign-conversion -Wshadow -Wold-style-cast
    -Wcast-qual -Wformat=2 -Wundef -Woverloaded-virtual -Wdouble-promotion
    $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond -Wlogical-op -Wno-restrict>)
  if(CORVANE_SANITIZE)
    target_compile_options(${target} PRIVATE
      -fsanitize=${CORVANE_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
    target_link_options(${target} PRIVATE -fsanitize=${CORVANE_SANITIZE})
  endif()
endfunction()
