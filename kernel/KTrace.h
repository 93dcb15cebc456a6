#pragma once

#include "kernel/KExport.h"
#include "kernel/KString.h"

// The trace sink: diagnostic lines from anywhere, the audio thread included. It takes no lock
// and does not allocate. Release builds drop the line unless a hook is installed; a build
// with TORVANE_DIAGNOSTICS writes it where the TORVANE_TRACE environment value says.
TORVANE_API void KTrace(const KString& line) noexcept;

// Receives every trace line instead of the default route (tests observe the sink this way).
// Answers the hook it replaced; null restores the default.
using KTraceHook = void (*)(const KString& line);
TORVANE_API KTraceHook KSetTraceHook(KTraceHook hook) noexcept;
