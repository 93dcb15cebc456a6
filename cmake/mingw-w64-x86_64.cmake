# Cross-builds the 64-bit Windows kernel with Debian's MinGW-w64 (the posix threads variant, for
# std::thread and std::mutex):
#   cmake -S . -B build/windows -G Ninja --toolchain cmake/mingw-w64-x86_64.cmake
# The third-party libraries come from scripts/windows-deps.sh, which installs them under
# TORVANE_WINDOWS_DEPS; the programs the build runs (bundlers, tests) run under Wine.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86_64)
set(TORVANE_MINGW x86_64-w64-mingw32)
set(CMAKE_C_COMPILER ${TORVANE_MINGW}-gcc-posix)
set(CMAKE_CXX_COMPILER ${TORVANE_MINGW}-g++-posix)
set(CMAKE_RC_COMPILER ${TORVANE_MINGW}-windres)

if(NOT TORVANE_WINDOWS_DEPS)
  set(TORVANE_WINDOWS_DEPS "$ENV{HOME}/.cache/torvane-win/prefix")
endif()
set(TORVANE_WINDOWS_DEPS "${TORVANE_WINDOWS_DEPS}" CACHE PATH "Prefix of the cross-built third-party libraries")
set(CMAKE_FIND_ROOT_PATH /usr/${TORVANE_MINGW} "${TORVANE_WINDOWS_DEPS}")
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# pkg-config answers for the cross-built libraries only, with what static linking needs.
set(ENV{PKG_CONFIG_LIBDIR} "${TORVANE_WINDOWS_DEPS}/lib/pkgconfig")
set(ENV{PKG_CONFIG_PATH} "")
set(PKG_CONFIG_ARGN --static)

# No MinGW DLL beside the kernel: the C++ runtime, libgcc and winpthread are linked in.
set(CMAKE_EXE_LINKER_FLAGS_INIT "-static")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-static")
set(CMAKE_MODULE_LINKER_FLAGS_INIT "-static")

# Programs of the build (bundlers, test discovery, the tests) run under Wine.
find_program(TORVANE_WINE NAMES wine64 wine PATHS /usr/lib/wine NO_CMAKE_FIND_ROOT_PATH)
if(TORVANE_WINE)
  set(CMAKE_CROSSCOMPILING_EMULATOR "${TORVANE_WINE}")
endif()
