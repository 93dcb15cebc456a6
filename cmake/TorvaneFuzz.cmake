# Fuzz targets, each built on its own with clang (libFuzzer comes with clang only) from just the
# sources it needs, with the project's warnings, under AddressSanitizer and
# UndefinedBehaviorSanitizer. scripts/fuzz.sh builds and runs them.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
if(NOT CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
  message(FATAL_ERROR "A fuzz target needs clang: CC=clang CXX=clang++ cmake ...")
endif()
if(NOT CMAKE_BUILD_TYPE)
  set(CMAKE_BUILD_TYPE RelWithDebInfo CACHE STRING "" FORCE)
endif()

get_filename_component(TORVANE_ROOT ${CMAKE_CURRENT_LIST_DIR}/.. ABSOLUTE)
include(${TORVANE_ROOT}/cmake/TorvaneTarget.cmake)

# torvane_fuzz_target(NAME SOURCES...): sources relative to the project root, the fuzz entry
# point relative to the calling folder first.
function(torvane_fuzz_target name entry)
  list(TRANSFORM ARGN PREPEND "${TORVANE_ROOT}/")
  add_executable(${name} ${entry} ${ARGN})
  torvane_defaults(${name})
  target_include_directories(${name} PRIVATE ${TORVANE_ROOT})
  target_compile_definitions(${name} PRIVATE TORVANE_STATIC)
  set(sanitizers -fsanitize=fuzzer,address,undefined)
  target_compile_options(${name} PRIVATE ${sanitizers} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  target_link_options(${name} PRIVATE ${sanitizers})
endfunction()
