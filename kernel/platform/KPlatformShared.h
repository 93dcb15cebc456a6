#pragma once

#include <cstdint>
#include <string>

// What the platform files of every system share. Nothing here calls the system: each platform
// file supplies its own process id and does its own creating and writing.
namespace KPlatformShared {
// Takes one of the write failures a test asked for (KPlatform::InjectAtomicWriteFailures):
// true while some were left.
bool ConsumeInjectedFailure() noexcept;
// A number no earlier call in this process answered, for names of temporary files and folders.
uint32_t NextTemporaryNumber() noexcept;
// A hidden sibling of `path` that no other writer uses: ".<name>.<process>-<number>.tmp".
std::string TemporarySiblingName(const std::string& path, unsigned long process);
}  // namespace KPlatformShared
