# Common settings of every target of ours: warnings as errors, sanitizers when asked for.
set(TORVANE_WARNINGS -Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Wold-style-cast
    -Wcast-align -Woverloaded-virtual -Wnull-dereference -Wimplicit-fallthrough -Werror)
# GCC 12 at -O3 reports overlapping copies inside std::string concatenation that cannot happen
# (a known false positive of that version); the warning stays on for every other compiler.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_CXX_COMPILER_VERSION VERSION_GREATER_EQUAL 12 AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
  list(APPEND TORVANE_WARNINGS -Wno-restrict)
endif()

if(TORVANE_SANITIZE)
  add_compile_options(-fsanitize=${TORVANE_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  add_link_options(-fsanitize=${TORVANE_SANITIZE})
endif()

# One implementation of kernel/platform per operating system.
# TORVANE_PLATFORM_LIBRARY_SOURCE is the run-time library loading alone, which the loaders and
# test hosts compile into themselves.
if(WIN32)
  set(TORVANE_PLATFORM_SOURCES platform/KPlatformShared.cpp platform/windows/KPlatformWindows.cpp)
  set(TORVANE_PLATFORM_LIBRARY_SOURCE ${PROJECT_SOURCE_DIR}/kernel/platform/windows/KPlatformLibraryWindows.cpp)
  set(TORVANE_PLATFORM_LIBS user32 winmm shell32 ole32)
else()
  find_package(Threads REQUIRED)
  set(TORVANE_PLATFORM_SOURCES platform/KPlatformShared.cpp platform/posix/KPlatformPosix.cpp)
  set(TORVANE_PLATFORM_LIBRARY_SOURCE ${PROJECT_SOURCE_DIR}/kernel/platform/posix/KPlatformLibraryPosix.cpp)
  set(TORVANE_PLATFORM_LIBS Threads::Threads ${CMAKE_DL_LIBS})
endif()

function(torvane_defaults target)
  target_compile_options(${target} PRIVATE ${TORVANE_WARNINGS})
  if(TORVANE_DIAGNOSTICS)
    target_compile_definitions(${target} PRIVATE TORVANE_DIAGNOSTICS=1)
  endif()
endfunction()

# Each subsystem sees only its own folder and the folders of what it depends on: the include
# path of a target is never the source root but views, one per subsystem, each a folder holding
# a single link (<build>/views/core/core -> <source>/core). An #include that runs against the
# declared dependencies therefore fails to compile.
function(torvane_view folder out)
  set(view "${PROJECT_BINARY_DIR}/views/${folder}")
  if(NOT EXISTS "${view}/${folder}")
    file(MAKE_DIRECTORY "${view}")
    file(CREATE_LINK "${PROJECT_SOURCE_DIR}/${folder}" "${view}/${folder}" SYMBOLIC)
  endif()
  set(${out} "${view}" PARENT_SCOPE)
endfunction()

# Globals that must stay local to the kernel library. GCC marks inline and template statics as
# unique global symbols, which the dynamic loader never unloads: the library would stay in the
# process after a host closed its last bundle, its globals alive for the next load.
set(TORVANE_LIBRARY_OPTIONS "")
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  set(TORVANE_LIBRARY_OPTIONS -fno-gnu-unique)
endif()

# An object library of one subsystem, compiled once for both the shared and the static kernel:
#   torvane_part(<target> [SOURCES] <files...> [DEPENDS <subsystem targets...>])
# called in the subsystem's folder. It sees that folder and, through DEPENDS (torvane_kernel when
# none are given), the folders of its dependencies, nothing else.
function(torvane_part name)
  cmake_parse_arguments(PART "" "" "SOURCES;DEPENDS" ${ARGN})
  file(RELATIVE_PATH folder "${PROJECT_SOURCE_DIR}" "${CMAKE_CURRENT_SOURCE_DIR}")
  string(REGEX REPLACE "/.*" "" folder "${folder}")
  if(NOT PART_DEPENDS AND NOT name STREQUAL "torvane_kernel")
    set(PART_DEPENDS torvane_kernel)
  endif()
  add_library(${name} OBJECT ${PART_SOURCES} ${PART_UNPARSED_ARGUMENTS})
  torvane_defaults(${name})
  torvane_view(${folder} view)
  target_include_directories(${name} PUBLIC ${view})
  target_link_libraries(${name} PUBLIC ${PART_DEPENDS})
  target_compile_options(${name} PRIVATE ${TORVANE_LIBRARY_OPTIONS})
  target_compile_definitions(${name} PRIVATE TORVANE_BUILDING_KERNEL)
  set_property(GLOBAL APPEND PROPERTY TORVANE_PARTS ${name})
endfunction()
