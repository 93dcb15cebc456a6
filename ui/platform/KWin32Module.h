#pragma once

#include <windows.h>

// The module (DLL or program) that holds this code. Window classes are registered under it, so
// that two kernels in one process (a host loading plug-ins of two bundles, a program linking the
// kernel that also loads a bundle) each own their classes and window procedures.
inline HINSTANCE KThisModule() noexcept {
  static const HINSTANCE self = [] {
    HMODULE module = nullptr;
    ::GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                         reinterpret_cast<LPCWSTR>(&KThisModule), &module);
    return module;
  }();
  return self;
}
