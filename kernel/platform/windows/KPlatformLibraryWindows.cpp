#include <string>

#include "kernel/platform/KPlatformLibrary.h"
#include "kernel/platform/windows/KWideText.h"

namespace {
// The failure LibraryError reports, per thread as the system keeps it; 0 when there was none.
thread_local DWORD tLastFailure = 0;

// The absolute path with backslashes: the loader resolves a library's dependencies from its
// folder only for such a path, and compares loaded modules by it.
std::wstring FullPath(const std::string& path) {
  const std::wstring wide = KPlatform::Wide(path);
  const DWORD length = ::GetFullPathNameW(wide.c_str(), 0, nullptr, nullptr);
  if (length == 0) return wide;
  std::wstring full(length, L'\0');
  const DWORD written = ::GetFullPathNameW(wide.c_str(), length, full.data(), nullptr);
  full.resize(written < length ? written : 0);
  return full.empty() ? wide : full;
}

template <typename T>
T Remember(T result) noexcept {
  if (!result) tLastFailure = ::GetLastError();
  return result;
}
}  // namespace

// The folder of the library comes first when its own dependencies are looked for, so a loader
// finds the kernel that lies beside it.
void* KPlatform::OpenLibrary(const std::string& path) noexcept {
  try {
    return Remember(static_cast<void*>(::LoadLibraryExW(FullPath(path).c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH)));
  } catch (...) {
    tLastFailure = ERROR_NOT_ENOUGH_MEMORY;
    return nullptr;
  }
}

void* KPlatform::FindSymbol(void* library, const char* name) noexcept {
  if (!library) return nullptr;
  return Remember(reinterpret_cast<void*>(::GetProcAddress(static_cast<HMODULE>(library), name)));
}

void KPlatform::CloseLibrary(void* library) noexcept {
  if (library) ::FreeLibrary(static_cast<HMODULE>(library));
}

bool KPlatform::IsLibraryLoaded(const std::string& path) noexcept {
  try {
    return ::GetModuleHandleW(FullPath(path).c_str()) != nullptr;
  } catch (...) {
    return false;
  }
}

std::string KPlatform::LibraryPathOf(const void* address) { return ModulePathOf(address); }

std::string KPlatform::LibraryError() {
  const DWORD failure = tLastFailure;
  tLastFailure = 0;
  if (failure == 0) return {};
  return SystemMessage(failure);
}
