#pragma once

// The editor window of the system the kernel is built for.
#if defined(_WIN32)
#include "ui/platform/KEditorWindowWin32.h"
using KEditorWindow = KEditorWindowWin32;
#else
#include "ui/platform/KEditorWindowX11.h"
using KEditorWindow = KEditorWindowX11;
#endif
