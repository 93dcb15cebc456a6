#pragma once

#include "kernel/KExport.h"
#include "kernel/KString.h"

// Shows a message to the user: a modal warning box on a desktop, the standard error stream
// otherwise. Called on the thread that failed; never throws.
TORVANE_API void KShowUserMessage(const KString& text) noexcept;

// Receives every user message instead of the platform (tests record messages this way).
// Answers the hook it replaced; null restores the platform.
using KUserMessageHook = void (*)(const KString& text);
TORVANE_API KUserMessageHook KSetUserMessageHook(KUserMessageHook hook) noexcept;
