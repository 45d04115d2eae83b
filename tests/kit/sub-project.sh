#!/usr/bin/env bash
# A debugger's own project has this tree in it, and builds a host and the libraries with Boost alone.
set -euo pipefail
tree=$(cd "$(dirname "$0")/../.." && pwd)
trial=$(mktemp -d)
trap 'rm -rf "$trial"' EXIT

cat >"$trial/CMakeLists.txt" <<END
cmake_minimum_required(VERSION 3.25)
project(Debugger CXX)
add_subdirectory($tree flash)
add_executable(host $tree/examples/minimal-host/main.cpp)
target_compile_features(host PRIVATE cxx_std_11)
target_compile_definitions(host PRIVATE
  FLASH_CORVANE_LIBRARY="\$<TARGET_FILE:FlashCorvane::flash_corvane>")
target_link_libraries(host PRIVATE FlashCorvane::headers \${CMAKE_DL_LIBS})
add_dependencies(host FlashCorvane::flash_corvane)
END
arguments=()
for package in CLI11 fmt nlohmann_json tomlplusplus ZLIB PkgConfig Threads GTest; do
    arguments+=("-DCMAKE_DISABLE_FIND_PACKAGE_$package=ON")
done
cmake --no-warn-unused-cli -G Ninja -S "$trial" -B "$trial/build" "${arguments[@]}" >/dev/null
cmake --build "$trial/build" >/dev/null
diff "$tree/tests/kit/minimal-host.txt" <("$trial/build/host")
