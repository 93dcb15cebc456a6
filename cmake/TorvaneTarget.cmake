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
if(WIN32)
  set(TORVANE_PLATFORM_SOURCES platform/windows/KPlatformWindows.cpp)
  set(TORVANE_PLATFORM_LIBS user32 winmm)
else()
  find_package(Threads REQUIRED)
  set(TORVANE_PLATFORM_SOURCES platform/posix/KPlatformPosix.cpp)
  set(TORVANE_PLATFORM_LIBS Threads::Threads ${CMAKE_DL_LIBS})
endif()

function(torvane_defaults target)
  target_compile_options(${target} PRIVATE ${TORVANE_WARNINGS})
  if(TORVANE_DIAGNOSTICS)
    target_compile_definitions(${target} PRIVATE TORVANE_DIAGNOSTICS=1)
  endif()
endfunction()

# An object library of one subsystem, compiled once for both the shared and the static kernel.
function(torvane_part name)
  add_library(${name} OBJECT ${ARGN})
  torvane_defaults(${name})
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_compile_definitions(${name} PRIVATE TORVANE_BUILDING_KERNEL)
endfunction()
