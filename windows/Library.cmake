# What libraries and tool need on Windows. The tool is built for 64 bit; the tests are not built.

enable_language(RC)

# The C++ runtime is linked into each library, so that a host needs no DLL of the compiler's.
# LibraryEntry.cpp says what the wrapped function is for.
if(CMAKE_SIZEOF_VOID_P EQUAL 8)
  set(windows_name x64)
  set(windows_link_options LINKER:--entry=LibraryEntry LINKER:--wrap=__imp_TlsAlloc)
else()
  set(windows_name x86)
  set(windows_link_options LINKER:--entry=_LibraryEntry@12 LINKER:--wrap=_imp__TlsAlloc@0)
endif()

# Gives a target a version resource, and the manifest that the line names.
function(corvane_windows_resources target file file_type description manifest)
  string(REPLACE "." "," version_numbers ${PROJECT_VERSION})
  configure_file(${PROJECT_SOURCE_DIR}/windows/Version.rc.in ${target}.rc @ONLY)
  target_sources(${target} PRIVATE ${CMAKE_CURRENT_BINARY_DIR}/${target}.rc)
endfunction()

# corvane_windows_library(TARGET DESCRIPTION): TARGET.dll with that text in its version resource.
function(corvane_windows_library target description)
  corvane_windows_resources(${target} ${target}.dll VFT_DLL ${description} "")
  target_sources(${target} PRIVATE ${PROJECT_SOURCE_DIR}/windows/LibraryEntry.cpp)
  target_link_options(${target} PRIVATE
    -static LINKER:--no-insert-timestamp ${windows_link_options})
  set_target_properties(${target} PROPERTIES PREFIX "")
endfunction()

# corvane_windows_program(TARGET DESCRIPTION): the same for TARGET.exe, which needs no DLL of the compiler's.
function(corvane_windows_program target description)
  set(manifest ${PROJECT_SOURCE_DIR}/windows/Tool.manifest)
  corvane_windows_resources(${target} ${target}.exe VFT_APP ${description}
    "1 24 /* a manifest */ \"${manifest}\"\n")
  set_property(SOURCE ${CMAKE_CURRENT_BINARY_DIR}/${target}.rc APPEND PROPERTY OBJECT_DEPENDS ${manifest})
  target_link_options(${target} PRIVATE -static LINKER:--no-insert-timestamp)
endfunction()

# corvane_import_library(NAME DEFINITIONS): a library to link with in place of the DLL whose exports
# the file lists. Calls by GCC's names get to the functions exported under Microsoft's.
function(corvane_import_library name definitions)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${definitions})
  file(READ ${definitions} text)
  string(REGEX REPLACE "(\"[^\"]+\") = ([^\n]+)" "\\2 == \\1" text "${text}")
  set(library ${CMAKE_CURRENT_BINARY_DIR}/${name})
  file(WRITE ${library}.def "${text}")
  execute_process(COMMAND ${CMAKE_DLLTOOL} --input-def ${library}.def --output-lib ${library}.a
                  COMMAND_ERROR_IS_FATAL ANY)
  add_library(${name} STATIC IMPORTED GLOBAL)
  set_target_properties(${name} PROPERTIES IMPORTED_LOCATION ${library}.a)
endfunction()

# Headers of libraries lie among those of Linux. A directory that holds nothing but links to them lets
# the compiler see no others.
function(corvane_header_library target folder header)
  find_path(found_${folder} ${folder}/${header} PATHS /usr/include NO_CMAKE_FIND_ROOT_PATH REQUIRED)
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/library-headers)
  file(CREATE_LINK ${found_${folder}}/${folder} ${PROJECT_BINARY_DIR}/library-headers/${folder} SYMBOLIC)
  add_library(${target} INTERFACE IMPORTED GLOBAL)
  target_include_directories(${target} INTERFACE ${PROJECT_BINARY_DIR}/library-headers)
endfunction()

corvane_header_library(Boost::headers boost version.hpp)
if(CORVANE_TOOL)
  corvane_header_library(fmt::fmt fmt format.h)
  target_compile_definitions(fmt::fmt INTERFACE FMT_HEADER_ONLY)
  corvane_header_library(nlohmann_json::nlohmann_json nlohmann json.hpp)
  corvane_header_library(tomlplusplus::tomlplusplus toml++ toml.h)
  # The compiler finds its own.
  add_library(ZLIB::ZLIB INTERFACE IMPORTED GLOBAL)
  target_link_libraries(ZLIB::ZLIB INTERFACE z)
  find_package(Threads REQUIRED)
endif()
