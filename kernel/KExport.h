#pragma once

// Marks the few symbols that leave the kernel library. Everything else is built with hidden
// visibility, so a host sees only the entry points.
#if defined(_WIN32)
#  if defined(TORVANE_BUILDING_KERNEL)
#    define TORVANE_API __declspec(dllexport)
#  elif defined(TORVANE_STATIC)
#    define TORVANE_API
#  else
#    define TORVANE_API __declspec(dllimport)
#  endif
#else
#  define TORVANE_API __attribute__((visibility("default")))
#endif

// The entry points of the per-plug-in loaders, which hold no kernel code of their own.
#if defined(_WIN32)
#  define TORVANE_LOADER_EXPORT extern "C" __declspec(dllexport)
#else
#  define TORVANE_LOADER_EXPORT extern "C" __attribute__((visibility("default")))
#endif
