# The compilers and libraries that the project needs, in the oldest versions that it was tried with.
# What is missing is named all at once, for whoever builds on another system than Debian, too.

set(oldest_compiler_GNU 12)
set(oldest_compiler_Clang 14)
set(oldest ${oldest_compiler_${CMAKE_CXX_COMPILER_ID}})
if(oldest AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS oldest)
  message(FATAL_ERROR "${CMAKE_CXX_COMPILER} is ${CMAKE_CXX_COMPILER_ID} ${CMAKE_CXX_COMPILER_VERSION}, "
    "which is too old: this needs GCC 12 or Clang 14, or a newer one; choose it with "
    "-DCMAKE_CXX_COMPILER=...")
endif()

# corvane_need(NAME VERSION PACKAGE [ARGUMENT]...): as find_package takes them, and the Debian package.
macro(corvane_need name version package)
  find_package(${name} ${version} QUIET ${ARGN})
  if(NOT ${name}_FOUND)
    set(found "")
    if(${name}_CONSIDERED_VERSIONS)
      list(GET ${name}_CONSIDERED_VERSIONS 0 found)
      string(PREPEND found ", found was ")
    endif()
    string(APPEND missing "\n  ${name} ${version} or newer${found} (${package})")
    list(APPEND missing_packages ${package})
  endif()
endmacro()

set(missing "")
set(missing_packages "")
corvane_need(Boost 1.74 libboost-dev CONFIG)
if(CORVANE_TOOL)
  corvane_need(fmt 9.1 libfmt-dev)
  corvane_need(nlohmann_json 3.11 nlohmann-json3-dev)
  corvane_need(tomlplusplus 3.3 libtomlplusplus-dev)
  corvane_need(ZLIB 1.2 zlib1g-dev)
  find_package(Threads REQUIRED)
  if(BUILD_TESTING)
    corvane_need(GTest 1.12 libgtest-dev)
  endif()
  if(CORVANE_BENCH)
    corvane_need(benchmark 1.7 libbenchmark-dev)
  endif()
endif()

if(missing)
  list(JOIN missing_packages " " missing_packages)
  message(FATAL_ERROR "These are missing; in brackets the names of Debian's packages:${missing}\n"
    "On Debian 'apt-get install ${missing_packages}' installs them. On other systems their packages have "
    "similar names; CMAKE_PREFIX_PATH tells where a library is that was installed by hand.")
endif()
