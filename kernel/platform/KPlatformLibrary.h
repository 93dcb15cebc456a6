#pragma once

#include <string>

// Shared libraries opened at run time. Kept apart from KPlatform.h and free of kernel types:
// the per-plug-in loaders and the test hosts cannot link the kernel (they are what loads it),
// so they compile this one platform file into themselves.
namespace KPlatform {

// Opens the library at `path` with every symbol bound at once and kept to itself (not visible
// to libraries opened later), so that two copies of one library may live side by side. Null on
// failure; LibraryError() tells why.
void* OpenLibrary(const std::string& path) noexcept;
// The address of an exported symbol, or null.
void* FindSymbol(void* library, const char* name) noexcept;
// Drops one reference to a library OpenLibrary answered.
void CloseLibrary(void* library) noexcept;
// Whether the library at `path` is loaded in this process; never loads it.
bool IsLibraryLoaded(const std::string& path) noexcept;
// The path of the loaded file that holds `address` (any object or function of the caller's own
// module); empty when the system cannot tell.
std::string LibraryPathOf(const void* address);
// The system's description of the latest failure of the calls above; empty when there was none.
std::string LibraryError();

}  // namespace KPlatform
