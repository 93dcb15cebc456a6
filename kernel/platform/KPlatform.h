#pragma once

#include <cstddef>
#include <cstdint>

// Every call into the operating system goes through here, one implementation per system
// (kernel/platform/<system>/). The rest of the kernel never includes an OS header.
namespace KPlatform {

// Milliseconds from a monotonic clock (the stamp of processing blocks and automation gestures).
uint64_t MillisecondClock() noexcept;

// A modal warning box without owner or title and with one OK button; where there is no
// desktop to show it on, the text goes to the standard error stream.
void ShowMessageBox(const char16_t* text, size_t length) noexcept;

// Diagnostic output of the trace sink: `line` is UTF-8 without a line end. Must be safe on
// the audio thread: no locks, one write per line.
void WriteTraceLine(const char* line, size_t length) noexcept;

// Where diagnostic trace lines go, from the TORVANE_TRACE environment value ("stderr" or a
// file path); false when tracing is not asked for.
bool OpenTraceDestination() noexcept;

}  // namespace KPlatform
