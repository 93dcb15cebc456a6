#pragma once

#include <cstdint>
#include <functional>

#include "ui/KGeometry.h"

class KEditor;
class KDrawer;

// Paints what is dirty in `editor` through `drawer`, then hands `present` the window pixels that
// changed (the logical area at the editor's scale, widened by one pixel for anti-aliased edges and
// kept inside the editor; nothing when nothing changed). A full repaint's duration, presentation
// included, goes to `lastFullPaintMs`. Answers how many pixels changed. Shared by the editor
// windows of every system.
int64_t KPaintEditorDirty(KEditor& editor, KDrawer& drawer, double& lastFullPaintMs, const std::function<void(const KRect&)>& present);
