#include <dlfcn.h>

#include "kernel/platform/KPlatformLibrary.h"

void* KPlatform::OpenLibrary(const std::string& path) noexcept { return ::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL); }

void* KPlatform::FindSymbol(void* library, const char* name) noexcept { return library ? ::dlsym(library, name) : nullptr; }

void KPlatform::CloseLibrary(void* library) noexcept {
  if (library) ::dlclose(library);
}

bool KPlatform::IsLibraryLoaded(const std::string& path) noexcept {
  void* library = ::dlopen(path.c_str(), RTLD_NOW | RTLD_NOLOAD);
  if (library) ::dlclose(library);
  return library != nullptr;
}

std::string KPlatform::LibraryPathOf(const void* address) {
  Dl_info info{};
  if (::dladdr(address, &info) == 0 || !info.dli_fname) return {};
  return info.dli_fname;
}

std::string KPlatform::LibraryError() {
  const char* error = ::dlerror();
  return error ? error : "";
}
