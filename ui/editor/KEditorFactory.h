#pragma once

#include <memory>

#include "kernel/KExport.h"
#include "ui/controls/KStyle.h"
#include "ui/editor/KEditor.h"

// How the host layer gets a plug-in's editor without seeing the plug-ins: the catalogue's maker
// (with each plug-in's sections, graphs and help) registers itself here; without one, the editor
// is generated from the parameter table alone.
using KEditorMaker = std::unique_ptr<KEditor> (*)(KAudioPlugin& plugin, KEditorHost* host, KStyle style);
TORVANE_API void KSetEditorMaker(KEditorMaker maker) noexcept;
TORVANE_API std::unique_ptr<KEditor> KMakeEditor(KAudioPlugin& plugin, KEditorHost* host, KStyle style);
